#include "host_support/Guard.h"
#include "peru/net/HTTPError.h"
#include "peru/net/HTTPOperation.h"
#include "peru/uri/URI.h"

#include <cerrno>
#include <cstdio>
#include <memory>
#include <utility>
#include <vector>

using namespace tonewright::host_support;
using namespace peru::net;

namespace {

constexpr size_t kBlock = 256 * 1024;

[[noreturn]] void failSystem(const std::string& doing, int error) {
    throw peru::CError(peru::CString::fromUTF8(doing + ": " + std::strerror(error)));
}

class CDownload : public peru::CObject {
public:
    explicit CDownload(const P<peru::IURI>& uri)
        : operation(peru::make<CHTTPOperation>(peru::make<CHTTPRequest>("GET", uri))) {}
    ~CDownload() override = default;

    const P<CHTTPOperation> operation;
    bool hasRun = false; // its body has been read: another run would overwrite the file with nothing
};

void run(CHTTPOperation& operation, const std::string& path, TONEWRIGHT_DownloadProgress progress,
         void* user) {
    operation.advance(true);
    const P<CHTTPResponse> response = operation.getResponse();
    if (!response->isSuccess())
        throw CHTTPError(response->getStatus(), response->getReason(), operation.getURI());
    std::unique_ptr<std::FILE, int (*)(std::FILE*)> file(std::fopen(path.c_str(), "wbe"), std::fclose);
    if (!file) failSystem(path + " cannot be written", errno);
    std::setvbuf(file.get(), nullptr, _IONBF, 0);
    const int64_t total = response->getContentLength();
    std::vector<char> block(kBlock);
    int64_t received = 0;
    while (const int64_t count = operation.getInStream()->readSome(block.data(), kBlock)) {
        if (std::fwrite(block.data(), 1, static_cast<size_t>(count), file.get()) !=
            static_cast<size_t>(count))
            failSystem(path + " cannot be written", errno);
        received += count;
        if (progress && progress(received, total, user) != TONEWRIGHT_CONTINUE) throw peru::CAbortedError();
    }
    if (std::fclose(file.release()) != 0) failSystem(path + " cannot be written", errno);
}

} // namespace

TONEWRIGHT_Handle TONEWRIGHT_Host_CreateDownload(const char16_t* uri) {
    return guard<TONEWRIGHT_Handle>(nullptr, [&] {
        if (!uri) throw peru::CError("A download needs a URI");
        return wrap(peru::make<CDownload>(peru::make<peru::CURI>(peru::CString::fromUTF16(uri))));
    });
}

int32_t TONEWRIGHT_Host_RunDownload(TONEWRIGHT_Handle download, const char* path,
                                    TONEWRIGHT_DownloadProgress progress, void* user) {
    return guard(0, [&] {
        const P<CDownload> object = require<CDownload>(download, "a download");
        if (!path || !*path) throw peru::CError("A download needs a path");
        if (std::exchange(object->hasRun, true)) throw peru::CError("A download runs only once");
        run(*object->operation, path, progress, user);
        return 1;
    });
}

void TONEWRIGHT_Host_CancelDownload(TONEWRIGHT_Handle download) {
    if (const P<CDownload> object = unwrap<CDownload>(download)) object->operation->cancel();
}

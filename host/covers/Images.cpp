#include "Images.h"

#include "Attachments.h"
#include "Failures.h"
#include "Files.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "peru/Errors.h"

#include <cstdio>
#include <stdexcept>

namespace host::covers {

namespace fs = std::filesystem;

int writeImages(const SImagesRequest& request) {
    bool isIncomplete = false;
    const int code = runForFile(request.file, [&] {
        const std::string bytes = readFile(request.file);
        const P<ced::CProject> project = ced::CProject::FromBytes(bytes);
        forEachAttachment(*project, bytes, [&](const SAttachment& each) {
            if (isCancelled()) throw peru::CAbortedError();
            if (each.bytes) requireFree(request.folder / each.name, request.force, request.file);
        });
        std::error_code error;
        fs::create_directories(request.folder, error);
        if (error) throw std::runtime_error(request.folder.string() + ": " + error.message());
        forEachAttachment(*project, bytes, [&](const SAttachment& each) {
            if (isCancelled()) throw peru::CAbortedError();
            const fs::path target = request.folder / each.name;
            if (!each.bytes) {
                isIncomplete = true;
                return;
            }
            writeFile(target, {reinterpret_cast<const char*>(each.bytes->getData()),
                               static_cast<size_t>(each.bytes->getSize())});
            std::printf("%s\n", toPrintable(target.native()).c_str());
        });
        flushOutput();
    });
    return code == kExitSuccess && isIncomplete ? kExitFailure : code;
}

} // namespace host::covers

#include "media/Download.h"

#include "base/CancelWatch.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"

#include <algorithm>
#include <cctype>
#include <stdexcept>
#include <string>
#include <tonewright/host.h>

namespace host {

namespace fs = std::filesystem;

CHandle createDownload(const fs::path& address) {
    const std::optional<std::u16string> uri = toUTF16(address.native());
    if (!uri) throw std::runtime_error(tr("host.Get.notUTF8", "The address is not UTF-8"));
    clearFailure();
    CHandle job(TONEWRIGHT_Host_CreateDownload(uri->c_str()));
    if (!job) throw std::runtime_error(takeFailure(tr("host.Playlist.address", "The address is invalid")));
    return job;
}

bool download(const fs::path& address, const fs::path& file, const DownloadProgress& progress) {
    const CHandle job = createDownload(address);
    const auto report = [](int64_t received, int64_t total, void* user) -> int32_t {
        const auto& show = *static_cast<const DownloadProgress*>(user);
        if (show) show(received, total);
        return isCancelled() ? TONEWRIGHT_STOP : TONEWRIGHT_CONTINUE;
    };
    const CCancelWatch watch([&] { TONEWRIGHT_Host_CancelDownload(job.get()); });
    const bool isDone = TONEWRIGHT_Host_RunDownload(job.get(), file.c_str(), report,
                                                    const_cast<DownloadProgress*>(&progress)) == 1;
    if (isCancelled()) return false;
    if (!isDone) throw std::runtime_error(takeFailure(tr("host.Get.failed", "The download failed")));
    return true;
}

} // namespace host

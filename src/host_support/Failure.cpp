#include "host_support/Guard.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"
#include "sonora2/context/LastFailure.h"

using namespace tonewright::host_support;
using sonora2::common::SFailure;

namespace {

// The record returned to the host, with a path in place of the URI. Valid until the next call on the thread.
thread_local SFailure t_shown;

std::string toPath(const std::string& uri) {
    if (uri.empty()) return {};
    const P<peru::IURI> parsed = peru::make<peru::CURI>(peru::CString::fromUTF8(uri));
    const std::string path = peru::CString::toStdString(peru::getPathes()->toPlatformPath(parsed));
    return path.empty() ? uri : path;
}

} // namespace

namespace tonewright::host_support {

void storeFailure(const std::exception& exception) noexcept {
    try {
        sonora2::common::setLastFailure(sonora2::common::describeFailure(exception));
    } catch (...) {
        storeUnknownFailure();
    }
}

void storeUnknownFailure() noexcept {
    try {
        sonora2::common::setLastFailure(
            {"", peru::CString::toStdString(peru::localize("tonewright.Failure.title", "Error")),
             peru::CString::toStdString(
                 peru::localize("tonewright.Failure.unknown", "An unknown error occurred")),
             ""});
    } catch (...) {
        // Out of memory: the previous record remains.
    }
}

} // namespace tonewright::host_support

int32_t TONEWRIGHT_Host_GetLastFailure(TONEWRIGHT_Failure* failure) {
    try {
        t_shown = sonora2::common::getLastFailure();
        t_shown.uri = toPath(t_shown.uri);
    } catch (...) {
        // The part copied so far is valid.
    }
    fillRecord(failure, {sizeof(*failure), t_shown.kind.c_str(), t_shown.title.c_str(),
                         t_shown.message.c_str(), t_shown.uri.c_str()});
    return t_shown.isEmpty() ? 0 : 1;
}

void TONEWRIGHT_Host_ClearLastFailure() {
    sonora2::common::clearLastFailure();
    t_shown = {};
}

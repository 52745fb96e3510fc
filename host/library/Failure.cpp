#include "library/Failure.h"

#include "base/Text.h"

#include <tonewright/host.h>

namespace host {

void clearFailure() {
    TONEWRIGHT_Host_ClearLastFailure();
}

std::string takeFailure(const std::string& unknown) {
    TONEWRIGHT_Failure failure = {};
    failure.size = sizeof failure;
    const bool isKnown = TONEWRIGHT_Host_GetLastFailure(&failure) == 1 && *failure.message;
    const std::string reason = isKnown ? withPaths(failure.message) : unknown;
    clearFailure();
    return reason;
}

std::string takeFailure(const std::string& unknown, const std::filesystem::path& about) {
    return asReason(takeFailure(unknown), about);
}

} // namespace host

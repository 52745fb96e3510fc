// Why the last operation on this thread failed, in parts, for hosts that should not parse log texts.
#pragma once

#include "peru/uri/IURI.h"
#include "sonora2/Api.h"

#include <exception>
#include <string>

namespace sonora2::common {

using peru::P;

// All texts are UTF-8 and may be empty.
struct SFailure {
    std::string kind; // class of the error, such as "peru::CFileNotFoundError"
    std::string title;
    std::string message;
    std::string uri; // of the file concerned, where known

    bool isEmpty() const { return kind.empty() && message.empty(); }
};

// Takes the file from the error itself if it knows one, otherwise from `file`.
SONORA2_API SFailure describeFailure(const std::exception& error, const P<peru::IURI>& file = nullptr);

// One record per thread, set by every export that fails with a reason and by plug-in handlers that find no
// plug-in. Success does not clear it: clear it before the call in question.
SONORA2_API void setLastFailure(const SFailure& failure) noexcept;
SONORA2_API SFailure getLastFailure();
SONORA2_API void clearLastFailure() noexcept;

} // namespace sonora2::common

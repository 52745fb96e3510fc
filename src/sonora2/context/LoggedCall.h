// Runs a call whose failure is only logged.
#pragma once

#include "peru/Errors.h"
#include "sonora2/context/ILogManager.h"

#include <exception>

namespace sonora2::common {

// The log may be empty.
template <class Call> void callLogged(const P<ILogManager>& log, Call&& call) noexcept {
    try {
        try {
            call();
        } catch (const peru::CException& exception) {
            if (log) log->logException(exception);
        } catch (const std::exception& exception) {
            if (log) log->logException(peru::CError(exception.what()));
        }
    } catch (...) {
        // The exception carries no text, or logging failed as well.
    }
}

} // namespace sonora2::common

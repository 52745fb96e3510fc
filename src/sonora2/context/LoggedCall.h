// Runs calls whose failure must not propagate.
#pragma once

#include "peru/Errors.h"
#include "sonora2/context/ILogManager.h"

#include <exception>

namespace sonora2::common {

// True if the call completed. Otherwise its exception is passed to `report`, as a peru::CException.
template <class Call, class Report> bool callReported(Call&& call, Report&& report) noexcept {
    try {
        try {
            call();
            return true;
        } catch (const peru::CException& exception) {
            report(exception);
        } catch (const std::exception& exception) {
            report(peru::CError(exception.what()));
        } catch (...) {
            report(peru::CError("unknown"));
        }
    } catch (...) {
        // Reporting failed as well, for instance for lack of memory.
    }
    return false;
}

// The same with a log, which may be empty.
template <class Call> bool callLogged(const P<ILogManager>& log, Call&& call) noexcept {
    return callReported(call, [&](const peru::CException& exception) {
        if (log) log->logException(exception);
    });
}

} // namespace sonora2::common

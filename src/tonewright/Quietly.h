// Runs code whose failure can only be logged.
#pragma once

#include "peru/Exception.h"
#include "peru/log/ILog.h"
#include "peru/strings/StringFormat.h"

#include <exception>

namespace tonewright {

// Returns true if the body completed; otherwise logs the reason, prefixed with `what`. Suitable for
// destructors and for threads that the library does not own.
template <class Body> bool quietly(const char* what, Body&& body) noexcept {
    try {
        const auto log = [what](const peru::CStringArg& reason) {
            peru::getLogManager()->error(peru::CString::fromUTF8("tonewright_shared"),
                                         peru::format("%s: %s", what, reason));
        };
        try {
            body();
            return true;
        } catch (const peru::CException& e) {
            log(e.getDescription());
        } catch (const std::exception& e) {
            log(e.what());
        } catch (...) {
            log("unknown");
        }
    } catch (...) {
        // Logging failed as well, for instance for lack of memory.
    }
    return false;
}

} // namespace tonewright

// For work whose failure nobody is left to hear of.
#pragma once

#include "peru/Exception.h"
#include "peru/log/ILog.h"
#include "peru/strings/StringFormat.h"

#include <exception>

namespace tonewright {

// True when the body ran to its end; else the log has the reason behind `what`. Fit for destructors and for
// threads that are not the library's own.
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
        // No memory for a line of the log.
    }
    return false;
}

} // namespace tonewright

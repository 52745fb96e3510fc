// Runs code whose failure can only be logged.
#pragma once

#include "peru/log/ILog.h"
#include "peru/strings/StringFormat.h"
#include "sonora2/context/LoggedCall.h"

namespace tonewright {

// Returns true if the body completed; otherwise logs the reason, prefixed with `what`. Suitable for
// destructors and for threads that the library does not own.
template <class Body> bool quietly(const char* what, Body&& body) noexcept {
    return sonora2::common::callReported(body, [what](const peru::CException& exception) {
        peru::getLogManager()->error(peru::CString::fromUTF8("tonewright_shared"),
                                     peru::format("%s: %s", what, exception.getDescription()));
    });
}

} // namespace tonewright

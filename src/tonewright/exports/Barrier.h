// Stops exceptions at the boundary of the library.
#pragma once

#include "crashhandler/CrashHandler.h"
#include "peru/Exception.h"
#include "peru/strings/String.h"

#include <exception>

namespace tonewright::exports {

// Logged for exceptions that carry no text of their own.
inline constexpr const char* kUnknownStdException = "unknown std::exception";
inline constexpr const char* kUnknown = "unknown";

// Writes an error's text to the log at its most severe level and to the debugger output, and records it as
// this thread's last failure. Null for an exception of an unknown type.
void reportException(const std::exception* error) noexcept;
// The same for the failure that is already recorded, if any.
void reportLastFailure() noexcept;

// Runs the body of an export. Returns `failure` after an exception; it is read only then, so the body may
// change it as it proceeds.
template <class R, class Body> R barrier(const R& failure, Body&& body) {
    crashhandler::useAlternateStack(); // for an overflow in a thread of the host's
    try {
        return static_cast<R>(body());
    } catch (const std::exception& e) {
        reportException(&e);
    } catch (...) {
        reportException(nullptr);
    }
    return failure;
}

// The same for an export without a result.
template <class Body> void barrier(Body&& body) {
    barrier(false, [&body] {
        body();
        return true;
    });
}

} // namespace tonewright::exports

// Stops exceptions at the boundary of the library.
#pragma once

#include "peru/Exception.h"
#include "peru/strings/String.h"

#include <exception>

namespace tonewright::exports {

// Logged for exceptions that carry no text of their own.
inline constexpr const char* kUnknownStdException = "unknown std::exception";
inline constexpr const char* kUnknown = "unknown";

// Writes the text, or `fallback` if it is empty, to the log at its most severe level and to the debugger
// output.
void reportException(const peru::P<peru::IString>& text, const char* fallback) noexcept;
void reportException(const char* text, const char* fallback) noexcept;

// Runs the body of an export. Returns `failure` after an exception; it is read only then, so the body may
// change it as it proceeds.
template <class R, class Body> R barrier(const R& failure, Body&& body) {
    try {
        return static_cast<R>(body());
    } catch (const peru::CException& e) {
        reportException(e.getDescription(), kUnknownStdException);
    } catch (const std::exception& e) {
        reportException(e.what(), kUnknownStdException);
    } catch (...) {
        reportException(kUnknown, kUnknown);
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

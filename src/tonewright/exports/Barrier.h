// Where exceptions stop.
#pragma once

#include "peru/Exception.h"
#include "peru/strings/String.h"

#include <exception>

namespace tonewright::exports {

// The texts that stand for an exception which says nothing about itself.
inline constexpr const char* kUnknownStdException = "unknown std::exception";
inline constexpr const char* kUnknown = "unknown";

// Writes the text to the log at its severest level and to the debugger output; `fallback` where it is empty.
void reportException(const peru::P<peru::IString>& text, const char* fallback) noexcept;
void reportException(const char* text, const char* fallback) noexcept;

// Runs the body of an export. After an exception the result is `failure`, which is read only then, so that a
// body may change what its failure means while it proceeds.
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

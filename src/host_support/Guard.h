// Catches exceptions at the C boundary and stores their reasons for TONEWRIGHT_Host_GetLastFailure.
#pragma once

#include "peru/Errors.h"
#include "tonewright/exports/Handles.h"
#include "tonewright/host.h"

#include <algorithm>
#include <cstring>
#include <exception>

namespace tonewright::host_support {

using exports::unwrap;
using exports::wrap;
using peru::P;

void storeFailure(const std::exception& exception) noexcept;
void storeUnknownFailure() noexcept;

// Runs the body of a function. After an exception the result is `failure` and the reason is stored for the
// calling thread.
template <class R, class Body> R guard(const R& failure, Body&& body) noexcept {
    try {
        return static_cast<R>(body());
    } catch (const std::exception& exception) {
        storeFailure(exception);
    } catch (...) {
        storeUnknownFailure();
    }
    return failure;
}

// The T behind a handle. Throws CError; `what` describes the expected object in the message.
template <class T> P<T> require(TONEWRIGHT_Handle handle, const char* what) {
    P<T> object = unwrap<T>(handle);
    if (!object) throw peru::CError(peru::CString::fromUTF8(std::string("The handle is not ") + what));
    return object;
}

// Fills a caller's record, which may be shorter or longer than ours. Its `size` member is not changed.
template <class Record> void fillRecord(Record* target, const Record& values) {
    if (!target) return;
    const size_t size = target->size;
    std::memcpy(static_cast<void*>(target), &values, std::min(size, sizeof(Record)));
    if (size >= sizeof(size)) target->size = size;
}

// Zero-terminates the text; if it does not fit, it is truncated between characters.
template <size_t Size> void copyText(char (&target)[Size], const std::string& text) {
    size_t length = std::min(text.size(), Size - 1);
    while (length < text.size() && length > 0 && (text[length] & 0xC0) == 0x80) --length;
    std::memcpy(target, text.data(), length);
    target[length] = '\0';
}

} // namespace tonewright::host_support

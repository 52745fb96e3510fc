// Functions of C interfaces that are called with a bad handle.
#pragma once

#include <gtest/gtest.h>

namespace tests {

template <class Result, class R, class T, class... Rest>
Result callWith(void* handle, R (*function)(T*, Rest...)) {
    return static_cast<Result>(function(static_cast<T*>(handle), Rest{}...));
}

// Each function returns `failure` for an object of a wrong kind and for null.
template <class Failure, class... Functions>
void expectRefused(void* wrong, Failure failure, Functions... functions) {
    for (void* handle : {wrong, static_cast<void*>(nullptr)}) {
        int index = 0;
        for (const Failure result : {callWith<Failure>(handle, functions)...})
            EXPECT_EQ(result, failure) << "function " << index++ << (handle ? "" : " with null");
    }
}

} // namespace tests

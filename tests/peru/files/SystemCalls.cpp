#include "peru/files/SystemCalls.h"

#include <cerrno>
#include <dlfcn.h>
#include <pthread.h>
#include <unistd.h>

namespace {

tests::CSystemCalls::Hook g_hook;

int ask(const char* call, int file) {
    return g_hook ? g_hook(call, file) : 0;
}

} // namespace

// The program's own definitions take precedence over the C library's.
#define WATCH(result, name, parameters, arguments, file)                                                     \
    extern "C" __attribute__((visibility("default"))) result name parameters {                               \
        static const auto next = reinterpret_cast<result(*) parameters>(::dlsym(RTLD_NEXT, #name));          \
        errno = ask(#name, file);                                                                            \
        return errno == 0 ? next arguments : -1;                                                             \
    }

WATCH(int, fsync, (int file), (file), file)
WATCH(int, fdatasync, (int file), (file), file)
WATCH(int, rename, (const char* from, const char* to) noexcept, (from, to), -1)
WATCH(int, linkat, (int from, const char* source, int to, const char* target, int flags) noexcept,
      (from, source, to, target, flags), -1)
WATCH(ssize_t, copy_file_range,
      (int from, off64_t* offset, int to, off64_t* target, size_t size, unsigned flags),
      (from, offset, to, target, size, flags), to)

#ifndef TONEWRIGHT_SANITIZED // the sanitizers have a definition of their own
extern "C" __attribute__((visibility("default"))) int pthread_create(pthread_t* thread,
                                                                     const pthread_attr_t* attributes,
                                                                     void* (*body)(void*),
                                                                     void* argument) noexcept {
    static const auto next =
        reinterpret_cast<decltype(&pthread_create)>(::dlsym(RTLD_NEXT, "pthread_create"));
    const int error = ask("pthread_create", -1);
    return error == 0 ? next(thread, attributes, body, argument) : error;
}
#endif

namespace tests {

CSystemCalls::CSystemCalls(Hook hook) {
    g_hook = std::move(hook);
}

CSystemCalls::~CSystemCalls() {
    g_hook = nullptr;
}

} // namespace tests

#include "peru/files/SystemCalls.h"

#include "peru/Errors.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <dlfcn.h>
#include <pthread.h>
#include <sys/stat.h>
#include <sys/xattr.h>
#include <unistd.h>
#include <utility>

namespace {

thread_local tests::CSystemCalls::Hook* t_hook = nullptr;
thread_local size_t t_ignored = 0;

int ask(const char* call, int file) {
    // The hook may make such calls itself.
    tests::CSystemCalls::Hook* const hook = std::exchange(t_hook, nullptr);
    const int answer = hook ? (*hook)(call, file) : 0;
    t_hook = hook;
    return answer;
}

} // namespace

// The program's own definitions take precedence over the C library's.
#define WATCH(result, name, parameters, arguments, file, size)                                               \
    WATCH_AS(#name, result, name, parameters, arguments, file, size)
#define WATCH_AS(call, result, name, parameters, arguments, file, size)                                      \
    extern "C" __attribute__((visibility("default"))) result name parameters {                               \
        static const auto next = reinterpret_cast<result(*) parameters>(::dlsym(RTLD_NEXT, #name));          \
        const int error = ask(call, file);                                                                   \
        if (error > 0) errno = error;                                                                        \
        if (error == tests::CSystemCalls::kHalf) size = (size + 1) / 2;                                      \
        return error > 0 ? -1 : next arguments;                                                              \
    }

WATCH(int, fsync, (int file), (file), file, t_ignored)
WATCH(int, fdatasync, (int file), (file), file, t_ignored)
WATCH(int, rename, (const char* from, const char* to) noexcept, (from, to), -1, t_ignored)
WATCH(int, linkat, (int from, const char* source, int to, const char* target, int flags) noexcept,
      (from, source, to, target, flags), -1, t_ignored)
WATCH(ssize_t, copy_file_range,
      (int from, off64_t* offset, int to, off64_t* target, size_t size, unsigned flags),
      (from, offset, to, target, size, flags), to, size)

#ifndef TONEWRIGHT_SANITIZED // the sanitizers have definitions of their own
WATCH(ssize_t, read, (int file, void* buffer, size_t size), (file, buffer, size), file, size)
WATCH(ssize_t, write, (int file, const void* buffer, size_t size), (file, buffer, size), file, size)
WATCH(ssize_t, pwrite, (int file, const void* buffer, size_t size, off_t at), (file, buffer, size, at), file,
      size)
WATCH(ssize_t, pread, (int file, void* buffer, size_t size, off_t at), (file, buffer, size, at), file, size)
// Fortified, unless the compiler can prove that the size fits.
WATCH_AS("pread", ssize_t, __pread_chk, (int file, void* buffer, size_t size, off_t at, size_t room),
         (file, buffer, size, at, room), file, size)
WATCH(ssize_t, send, (int file, const void* buffer, size_t size, int flags), (file, buffer, size, flags),
      file, size)
WATCH(int, ftruncate, (int file, off_t size) noexcept, (file, size), file, t_ignored)
WATCH(int, fchmod, (int file, mode_t mode) noexcept, (file, mode), file, t_ignored)
WATCH(int, fchown, (int file, uid_t user, gid_t group) noexcept, (file, user, group), file, t_ignored)
WATCH(int, futimens, (int file, const timespec* times) noexcept, (file, times), file, t_ignored)
WATCH(int, fsetxattr, (int file, const char* key, const void* value, size_t size, int flags) noexcept,
      (file, key, value, size, flags), file, t_ignored)
WATCH(ssize_t, fgetxattr, (int file, const char* key, void* value, size_t size) noexcept,
      (file, key, value, size), file, t_ignored)
WATCH(ssize_t, flistxattr, (int file, char* list, size_t size) noexcept, (file, list, size), file, t_ignored)
WATCH(int, renameat2, (int from, const char* source, int to, const char* target, unsigned flags) noexcept,
      (from, source, to, target, flags), -1, t_ignored)

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

CSystemCalls::CSystemCalls(Hook hook) : m_hook(std::move(hook)) {
    t_hook = &m_hook;
}

CSystemCalls::~CSystemCalls() {
    t_hook = nullptr;
}

int interrupt(const std::string& call, int) {
    static unsigned s_count = 0;
    const bool transfers = call.ends_with("read") || call.ends_with("write") || call == "send";
    if (!transfers && call != "ftruncate" && call != "fdatasync") return 0;
    if (s_count++ % 2 == 0) return EINTR;
    return s_count % 4 == 0 && transfers ? CSystemCalls::kHalf : 0;
}

void failEach(const std::initializer_list<SFailingCall>& calls, const std::function<void()>& run,
              const std::function<void(bool done)>& check) {
    for (const SFailingCall& each : calls) {
        if (!CSystemCalls::kWatchesAll) return;
        SCOPED_TRACE(std::string(each.name) + " " + std::to_string(each.error));
        const CSystemCalls watch([&](const std::string& call, int file) {
            return call == "copy_file_range" ? EOPNOTSUPP
                   : call == each.name       ? each.error
                                             : interrupt(call, file);
        });
        bool done = true;
        try {
            run();
        } catch (const peru::CFileError&) {
            done = false;
        }
        EXPECT_EQ(done, each.tolerated);
        check(done);
    }
}

} // namespace tests

// The memory map of the process, for use in signal handlers.
#pragma once

#include <cstddef>
#include <cstdint>
#include <fcntl.h>
#include <unistd.h>

namespace crashhandler {

// One line of /proc/self/maps.
struct SMapping {
    uintptr_t start = 0;
    uintptr_t end = 0;
    uint64_t offset = 0;
    bool isReadable = false;
    char path[512] = {}; // empty for anonymous memory
};

SMapping parseMapping(const char* line);

// Calls `callback` for every mapping of the process, without allocating.
template <class Callback> void forEachMapping(Callback callback) {
    const int file = ::open("/proc/self/maps", O_RDONLY | O_CLOEXEC);
    if (file < 0) return;
    char line[1024] = {};
    size_t length = 0;
    char buffer[4096];
    for (ssize_t got; (got = ::read(file, buffer, sizeof buffer)) > 0;) {
        for (ssize_t i = 0; i < got; ++i) {
            if (buffer[i] != '\n') {
                if (length + 1 < sizeof line) line[length++] = buffer[i];
                continue;
            }
            line[length] = '\0';
            length = 0;
            callback(parseMapping(line));
        }
    }
    ::close(file);
}

} // namespace crashhandler

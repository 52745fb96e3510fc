// Arbitrary bytes as the header of a plain sound container: nothing, or a format that makes sense.
#include "PlainHeader.h"

#include <cstdint>
#include <cstdlib>
#include <string>
#include <sys/mman.h>
#include <unistd.h>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static const int file = ::memfd_create("header", MFD_CLOEXEC);
    static const std::string path = "/proc/self/fd/" + std::to_string(file);
    if (::ftruncate(file, 0) != 0 || ::pwrite(file, data, size, 0) != static_cast<ssize_t>(size)) return 0;
    if (const auto format = host::readPlainHeader(path))
        if (format->rate <= 0 || format->channels <= 0 || format->bytesPerSample < 1 ||
            format->bytesPerSample > 4)
            std::abort();
    return 0;
}

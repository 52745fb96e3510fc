#include "codecs/Mp4Length.h"

#include <algorithm>
#include <cstddef>
#include <string_view>

namespace sonora2::plugins::av {

namespace {

struct SBox {
    int64_t start = 0; // of its content
    int64_t end = 0;
};

// Big-endian; 0 behind the end of the file.
uint64_t readNumber(std::FILE* file, int bytes) {
    uint64_t number = 0;
    for (int i = 0; i < bytes; ++i) {
        const int byte = std::fgetc(file);
        if (byte == EOF) return 0;
        number = number << 8 | static_cast<uint64_t>(byte);
    }
    return number;
}

// The box of that type with that index among its siblings.
bool findBox(std::FILE* file, const SBox& parent, std::string_view type, int index, SBox& found) {
    for (int64_t at = parent.start; at + 8 <= parent.end;) {
        if (::fseeko(file, at, SEEK_SET) != 0) return false;
        int64_t size = static_cast<int64_t>(readNumber(file, 4));
        char name[4] = {};
        if (std::fread(name, 1, 4, file) != 4) return false;
        int64_t header = 8;
        if (size == 1) {
            size = static_cast<int64_t>(std::min<uint64_t>(readNumber(file, 8), INT64_MAX / 2));
            header = 16;
        } else if (size == 0) {
            size = parent.end - at;
        }
        if (size < header || size > parent.end - at) return false;
        if (std::string_view(name, 4) == type && index-- == 0) {
            found = {at + header, at + size};
            return true;
        }
        at += size;
    }
    return false;
}

} // namespace

int64_t readMediaDuration(std::FILE* file, int track) {
    if (::fseeko(file, 0, SEEK_END) != 0) return 0;
    SBox box{0, ::ftello(file)};
    const bool isFound = findBox(file, box, "moov", 0, box) && findBox(file, box, "trak", track, box) &&
                         findBox(file, box, "mdia", 0, box) && findBox(file, box, "mdhd", 0, box);
    if (!isFound || ::fseeko(file, box.start, SEEK_SET) != 0) return 0;
    const bool isLong = readNumber(file, 4) >> 24 == 1; // version
    // Two times and the time scale come first.
    if (::fseeko(file, isLong ? 20 : 12, SEEK_CUR) != 0) return 0;
    const uint64_t duration = readNumber(file, isLong ? 8 : 4);
    return duration < (1ull << 40) && duration != 0xFFFFFFFF ? static_cast<int64_t>(duration) : 0;
}

} // namespace sonora2::plugins::av

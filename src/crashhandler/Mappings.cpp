#include "crashhandler/Mappings.h"

#include <cstring>

namespace crashhandler {

namespace {

uint64_t parseHex(const char*& text) {
    uint64_t value = 0;
    for (;; ++text) {
        const char c = *text;
        if (c >= '0' && c <= '9')
            value = value * 16 + static_cast<uint64_t>(c - '0');
        else if (c >= 'a' && c <= 'f')
            value = value * 16 + static_cast<uint64_t>(c - 'a' + 10);
        else
            return value;
    }
}

} // namespace

SMapping parseMapping(const char* line) {
    SMapping mapping;
    mapping.start = parseHex(line);
    ++line; // "-"
    mapping.end = parseHex(line);
    mapping.isReadable = line[1] == 'r';
    line += 6; // " r-xp "
    mapping.offset = parseHex(line);
    if (const char* path = std::strchr(line, '/')) std::strncpy(mapping.path, path, sizeof mapping.path - 1);
    return mapping;
}

} // namespace crashhandler

// A stream over arbitrary bytes.
#pragma once

#include "support/MediaFile.h"

#include <cstdlib>
#include <string>

inline void require(bool condition) {
    if (!condition) std::abort();
}

inline sonora2::plugins::InputFile openBytes(std::string& bytes) {
    sonora2::plugins::InputFile file(::fmemopen(bytes.data(), bytes.size(), "rb"));
    require(file != nullptr);
    return file;
}

// The file types that the plug-ins over libav read and write.
#pragma once

#include <cstdint>
#include <span>

namespace sonora2::plugins::av {

enum EKind : uint8_t {
    kSound = 1,
    kVideo = 2,   // with or without sound
    kWindows = 4, // belongs to the plug-in for Windows Media
    kWritten = 8,
};

struct SExtension {
    const char* name; // lower case
    uint8_t kind;     // of EKind
    const char* description;
};

// In no particular order. Types that other plug-ins read are not among them.
std::span<const SExtension> getExtensions();

} // namespace sonora2::plugins::av

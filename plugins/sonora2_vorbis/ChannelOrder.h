// Vorbis and WAV order the speakers of a frame differently.
#pragma once

namespace sonora2::plugins {

// For each channel in the order of chunks (that of WAV), its index in a Vorbis stream. Source: Vorbis I,
// section 4.3.9. Null where both agree: one, two and four channels, and the layouts that Vorbis leaves to
// the application.
inline const int* getVorbisChannelOrder(int channels) {
    static constexpr int k3[] = {0, 2, 1};
    static constexpr int k5[] = {0, 2, 1, 3, 4};
    static constexpr int k6[] = {0, 2, 1, 5, 3, 4};
    static constexpr int k7[] = {0, 2, 1, 6, 5, 3, 4};
    static constexpr int k8[] = {0, 2, 1, 7, 5, 6, 3, 4};
    switch (channels) {
    case 3:
        return k3;
    case 5:
        return k5;
    case 6:
        return k6;
    case 7:
        return k7;
    case 8:
        return k8;
    default:
        return nullptr;
    }
}

} // namespace sonora2::plugins

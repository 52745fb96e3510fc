// Vorbis and WAV store the channels of a frame in different orders.
#pragma once

namespace sonora2::plugins {

// Maps each channel in chunk order (that of WAV) to its index in a Vorbis stream, as defined by Vorbis I,
// section 4.3.9. Null where both orders agree: one, two and four channels, and layouts that Vorbis leaves
// undefined.
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

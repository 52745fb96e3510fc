// The equalizer's presets.
#pragma once

#include "tonewright/audiotools.h"

#include <array>

namespace audiotools {

struct SEqualizerPreset {
    const char* name;
    std::array<double, TONEWRIGHT_EQUALIZER_BANDS> gains; // decibels, lowest band first
};

// Null for 0 and unknown numbers.
const SEqualizerPreset* findEqualizerPreset(int preset);

} // namespace audiotools

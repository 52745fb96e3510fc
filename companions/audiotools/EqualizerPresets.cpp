#include "EqualizerPresets.h"

#include <iterator>

namespace audiotools {

namespace {

// Projects store the numbers, so new presets go to the end.
// clang-format off
constexpr SEqualizerPreset kPresets[] = {
    //                    31    62   125   250   500    1k    2k    4k    8k   16k
    {"Rock",           { 4.5,  4.0,  2.5,  0.5, -1.0, -1.0,  0.5,  2.5,  3.5,  4.0}},
    {"Pop",            {-1.0, -0.5,  0.5,  2.0,  3.5,  3.5,  2.0,  0.5, -0.5, -1.0}},
    {"Jazz",           { 3.0,  2.5,  1.0,  1.5, -1.5, -1.5,  0.0,  1.0,  2.5,  3.0}},
    {"Classical",      { 3.5,  3.0,  2.0,  1.5, -0.5, -0.5,  0.0,  1.5,  2.5,  3.0}},
    {"Dance",          { 4.0,  5.5,  4.0,  0.0,  1.0,  2.5,  4.0,  3.5,  2.5,  0.0}},
    {"Electronic",     { 4.0,  3.5,  1.0,  0.0, -1.5,  1.5,  0.5,  1.0,  3.5,  4.5}},
    {"Hip-hop",        { 5.0,  4.0,  1.5,  2.5, -1.0, -1.0,  1.0, -0.5,  1.5,  2.5}},
    {"Acoustic",       { 4.0,  3.5,  2.5,  1.0,  1.5,  1.5,  2.5,  3.0,  2.5,  1.5}},
    {"Piano",          { 2.0,  1.5,  0.0,  2.0,  2.5,  1.0,  2.5,  3.5,  2.5,  3.0}},
    {"Speech",         {-6.0, -4.0, -1.0,  0.5,  2.0,  3.5,  3.5,  2.5,  0.5, -2.0}},
    {"Vocal boost",    {-1.5, -2.0, -2.0,  1.0,  3.0,  3.0,  2.5,  1.0,  0.0, -1.0}},
    {"Bass boost",     { 6.0,  5.0,  4.0,  2.5,  1.0,  0.0,  0.0,  0.0,  0.0,  0.0}},
    {"Bass cut",       {-6.0, -5.0, -4.0, -2.5, -1.0,  0.0,  0.0,  0.0,  0.0,  0.0}},
    {"Treble boost",   { 0.0,  0.0,  0.0,  0.0,  0.0,  1.0,  2.5,  4.0,  5.0,  6.0}},
    {"Treble cut",     { 0.0,  0.0,  0.0,  0.0,  0.0, -1.0, -2.5, -4.0, -5.0, -6.0}},
    {"Loudness",       { 6.0,  4.5,  2.0,  0.0, -1.5, -1.5,  0.0,  1.5,  3.5,  5.0}},
    {"Small speakers", { 0.0,  3.0,  5.0,  4.0,  1.5,  0.0, -1.0, -1.5,  1.0,  2.0}},
    {"Headphones",     { 2.5,  3.5,  2.5,  0.5, -1.0, -0.5,  1.0,  2.0,  3.0,  3.5}},
    {"Night",          {-6.0, -5.0, -3.0, -1.0,  0.0,  1.0,  2.0,  1.0, -1.0, -2.0}},
};
// clang-format on

} // namespace

const SEqualizerPreset* findEqualizerPreset(int preset) {
    return preset >= 1 && preset <= static_cast<int>(std::size(kPresets)) ? &kPresets[preset - 1] : nullptr;
}

} // namespace audiotools

// Loudness, and the gain that brings sound to a target.
#pragma once

#include "library/Library.h"

#include <filesystem>
#include <functional>
#include <string>
#include <tonewright/host.h>
#include <vector>

namespace host {

constexpr double kDefaultTarget = -18.0; // LUFS

// The highest true peak that a gain above 0 dB may lead to, in dBTP: room for codecs and converters, whose
// curve through the samples is not exactly the measured one.
constexpr double kHighestTruePeak = -1.0;

// Reads a source from its current position to its end and closes it. Empty if Ctrl-C ended it. Throws
// std::runtime_error with the reason; `file` is what it is about.
CHandle measureLoudness(const CHandle& source, const std::filesystem::path& file,
                        const std::function<void(double fraction)>& progress);

// Of measurements together; at least one.
TONEWRIGHT_Loudness getLoudness(const std::vector<TONEWRIGHT_Handle>& measurements);

bool isMeasurable(const TONEWRIGHT_Loudness& loudness);

double toDecibels(double factor); // negative infinity for 0
double toFactor(double decibels);

// Decibels.
struct SGain {
    double wanted = 0;  // to the target
    double limited = 0; // as much of it as the peaks allow
};

// A gain above 0 dB ends where the true peak reaches kHighestTruePeak, and is not turned into one below 0 dB.
// Samples above full scale, which floating-point sound has, are brought back to it. 0 dB for sound that
// cannot be measured.
SGain findGain(const TONEWRIGHT_Loudness& loudness, double target);

// "+3.2", "-inf"
std::string formatDecibels(double decibels, bool hasSign);

} // namespace host

#include "media/Loudness.h"

#include "base/Cancel.h"
#include "base/Translation.h"
#include "library/Failure.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <stdexcept>

namespace host {

namespace {

struct SRunning {
    const std::function<void(double)>& progress;
    bool stopped = false;
};

int32_t onProgress(double fraction, void* user) {
    auto& running = *static_cast<SRunning*>(user);
    running.progress(std::clamp(fraction, 0.0, 1.0));
    running.stopped = isCancelled();
    return running.stopped ? TONEWRIGHT_DISCARD : TONEWRIGHT_CONTINUE;
}

std::string failure() {
    return tr("host.Loudness.failed", "The loudness could not be measured");
}

} // namespace

CHandle measureLoudness(const CHandle& source, const std::filesystem::path& file,
                        const std::function<void(double fraction)>& progress) {
    clearFailure();
    SRunning running{progress};
    CHandle measurement(TONEWRIGHT_Host_MeasureLoudness(source.get(), onProgress, &running));
    if (!measurement && !running.stopped) throw std::runtime_error(takeFailure(failure(), file));
    return measurement;
}

TONEWRIGHT_Loudness getLoudness(const std::vector<TONEWRIGHT_Handle>& measurements) {
    TONEWRIGHT_Loudness loudness = {};
    loudness.size = sizeof loudness;
    clearFailure();
    if (TONEWRIGHT_Host_GetLoudness(measurements.data(), static_cast<int32_t>(measurements.size()),
                                    &loudness) != 1)
        throw std::runtime_error(takeFailure(failure()));
    return loudness;
}

bool isMeasurable(const TONEWRIGHT_Loudness& loudness) {
    return std::isfinite(loudness.integrated);
}

double toDecibels(double factor) {
    return 20.0 * std::log10(factor);
}

double toFactor(double decibels) {
    return std::pow(10.0, decibels / 20.0);
}

SGain findGain(const TONEWRIGHT_Loudness& loudness, double target) {
    if (!isMeasurable(loudness)) return {};
    SGain gain;
    gain.wanted = target - loudness.integrated;
    gain.limited = gain.wanted;
    if (gain.wanted > 0.0)
        gain.limited = std::clamp(kHighestTruePeak - toDecibels(loudness.truePeak), 0.0, gain.wanted);
    gain.limited = std::min(gain.limited, std::max(0.0, gain.limited) - toDecibels(loudness.samplePeak));
    return gain;
}

std::string formatDecibels(double decibels, bool hasSign) {
    char text[32];
    // No "-0.0".
    const double shown = std::fabs(decibels) < 0.05 ? 0.0 : decibels;
    std::snprintf(text, sizeof text, hasSign ? "%+.1f" : "%.1f", shown);
    return text;
}

} // namespace host

// The functions of the library, none of which throws.
#include "Analysator.h"
#include "Equalizer.h"
#include "EqualizerPresets.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <new>

namespace {

using namespace audiotools;

constexpr double kFullScale = 32767.0;
constexpr double kNotMeasured = std::numeric_limits<double>::quiet_NaN();

CAnalysator& toObject(TONEWRIGHT_Analysator* self) {
    return *static_cast<CAnalysator*>(self);
}

CEqualizer& toObject(TONEWRIGHT_Equalizer* self) {
    return *static_cast<CEqualizer*>(self);
}

// A measurement without all of its sound would be wrong.
template <class Body> void callAnalysator(TONEWRIGHT_Analysator* self, Body body) noexcept {
    try {
        body(toObject(self));
    } catch (const std::bad_alloc&) {
        toObject(self).invalidate();
    }
}

using Measure = double (*)(std::span<const CAnalysator* const>);

double measure(TONEWRIGHT_Analysator* const* analysators, size_t count, Measure result) noexcept {
    try {
        std::vector<const CAnalysator*> objects;
        for (size_t i = 0; i < count; ++i) objects.push_back(&toObject(analysators[i]));
        return result(objects);
    } catch (const std::bad_alloc&) {
        return kNotMeasured;
    }
}

const TONEWRIGHT_AnalysatorOperations kAnalysatorOperations = {
    [] {},
    [](TONEWRIGHT_Analysator* self, int32_t channelCount, int32_t bytesPerSample, int32_t sampleRate) {
        callAnalysator(
            self, [&](CAnalysator& object) { object.initialise(channelCount, bytesPerSample, sampleRate); });
    },
    [](TONEWRIGHT_Analysator* self) { delete static_cast<CAnalysator*>(self); },
    [](TONEWRIGHT_Analysator* self, const void* samples, int64_t byteCount) {
        if (!samples || byteCount <= 0) return;
        callAnalysator(self, [&](CAnalysator& object) {
            object.analyse(static_cast<const uint8_t*>(samples), static_cast<size_t>(byteCount));
        });
    },
    [](TONEWRIGHT_Analysator* self) { return measure(&self, 1, CAnalysator::measure); },
};

const TONEWRIGHT_EqualizerOperations kEqualizerOperations = {
    [] {},
    [](TONEWRIGHT_Equalizer* self, int32_t sampleRate, int32_t bytesPerSample, int32_t channelCount) {
        try {
            toObject(self).configure(sampleRate, bytesPerSample, channelCount);
        } catch (const std::bad_alloc&) {
            // The samples are not changed.
        }
    },
    [](TONEWRIGHT_Equalizer* self, int32_t preset) {
        try {
            toObject(self).select(preset);
        } catch (const std::bad_alloc&) {
            // Some of the bands may be missing.
        }
    },
    [](TONEWRIGHT_Equalizer* self, void* samples, int64_t byteCount) {
        if (samples && byteCount > 0)
            toObject(self).process(static_cast<uint8_t*>(samples), static_cast<size_t>(byteCount));
    },
    [](TONEWRIGHT_Equalizer* self) { delete static_cast<CEqualizer*>(self); },
};

} // namespace

TONEWRIGHT_Analysator* createNormalizeAnalysator() {
    return createLoudnessAnalysator(0);
}

TONEWRIGHT_Analysator* createLoudnessAnalysator(int32_t flags) {
    auto* analysator = new (std::nothrow) CAnalysator(flags);
    if (analysator) analysator->operations = &kAnalysatorOperations;
    return analysator;
}

double convertDeltaDBValue(double decibels) {
    const double value = kFullScale * std::pow(10.0, decibels / 20.0);
    return std::isfinite(decibels) && std::isfinite(value) ? value : kFullScale;
}

int32_t getAnalysatorPeaks(TONEWRIGHT_Analysator* analysator, double* samplePeak, double* truePeak) {
    double sampleValue = 0.0, trueValue = 0.0;
    if (!analysator || !toObject(analysator).getPeaks(sampleValue, trueValue)) return 0;
    if (samplePeak) *samplePeak = sampleValue;
    if (truePeak) *truePeak = trueValue;
    return 1;
}

double getAnalysatorLoudness(TONEWRIGHT_Analysator* const* analysators, int32_t count) {
    if (!analysators || count < 1) return kNotMeasured;
    return measure(analysators, static_cast<size_t>(count), CAnalysator::measure);
}

double getAnalysatorRange(TONEWRIGHT_Analysator* const* analysators, int32_t count) {
    if (!analysators || count < 1) return kNotMeasured;
    return measure(analysators, static_cast<size_t>(count), CAnalysator::measureRange);
}

int32_t forgetAnalysatorPeaks(TONEWRIGHT_Analysator* analysator) {
    return analysator && toObject(analysator).forgetPeaks() ? 1 : 0;
}

void finishAnalysator(TONEWRIGHT_Analysator* analysator) {
    if (analysator) callAnalysator(analysator, [](CAnalysator& object) { object.finish(); });
}

TONEWRIGHT_Equalizer* createEqualizer() {
    auto* equalizer = new (std::nothrow) CEqualizer;
    if (equalizer) equalizer->operations = &kEqualizerOperations;
    return equalizer;
}

const char* getEqualizerPreset(int32_t preset, double gains[TONEWRIGHT_EQUALIZER_BANDS]) {
    const SEqualizerPreset* const found = findEqualizerPreset(preset);
    if (found && gains) std::copy(found->gains.begin(), found->gains.end(), gains);
    return found ? found->name : nullptr;
}

// Measures loudness and applies gains.
#include "host_support/GainSource.h"
#include "host_support/Guard.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"
#include "sonora2/media/CloseGuard.h"
#include "sonora2/plugins/CompanionLibrary.h"
#include "tonewright/audiotools.h"

#include <cmath>
#include <new>
#include <vector>

using namespace tonewright::host_support;
using sonora2::common::IAudioSource;
using sonora2::common::IFloatSamples;

namespace {

// Loaded with the first measurement and held by each of them.
class CAudioTools : public peru::CObject {
public:
    CAudioTools()
        : m_library(sonora2::common::loadCompanionLibrary("audiotools")),
          create(find<decltype(createLoudnessAnalysator)>("createLoudnessAnalysator")),
          getPeaks(find<decltype(getAnalysatorPeaks)>("getAnalysatorPeaks")),
          getLoudness(find<decltype(getAnalysatorLoudness)>("getAnalysatorLoudness")),
          getRange(find<decltype(getAnalysatorRange)>("getAnalysatorRange")),
          finish(find<decltype(finishAnalysator)>("finishAnalysator")) {}
    ~CAudioTools() override = default;

private:
    template <class Function> Function* find(const char* name) const {
        return sonora2::common::requireFunction<Function>(m_library, name);
    }
    const P<peru::IDynamicLibrary> m_library;

public:
    decltype(createLoudnessAnalysator)* const create;
    decltype(getAnalysatorPeaks)* const getPeaks;
    decltype(getAnalysatorLoudness)* const getLoudness;
    decltype(getAnalysatorRange)* const getRange;
    decltype(finishAnalysator)* const finish;
};

class CMeasurement : public peru::CObject {
public:
    CMeasurement(bool isFloat, int channels, int bytesPerSample, int rate)
        : tools(peru::make<CAudioTools>()),
          analysator(tools->create(TONEWRIGHT_ANALYSATOR_PEAKS | TONEWRIGHT_ANALYSATOR_RANGE |
                                   (isFloat ? TONEWRIGHT_ANALYSATOR_FLOAT : 0))) {
        if (!analysator) throw std::bad_alloc();
        analysator->operations->initialise(analysator, channels, bytesPerSample, rate);
        if (std::isnan(analysator->operations->result(analysator))) {
            analysator->operations->destroy(analysator);
            throw peru::CError(peru::localize(
                "tonewright.Loudness.format",
                "The loudness of %CHANNELS% channels at %RATE% Hz cannot be measured",
                {{"%CHANNELS%", peru::format("%d", channels)}, {"%RATE%", peru::format("%d", rate)}}));
        }
    }
    ~CMeasurement() override { analysator->operations->destroy(analysator); }
    CMeasurement(const CMeasurement&) = delete;
    CMeasurement& operator=(const CMeasurement&) = delete;

    void add(sonora2::audio::IAudioChunk& chunk) const {
        analysator->operations->analyse(analysator, chunk.getData(), chunk.getSize());
    }

    const P<CAudioTools> tools;
    TONEWRIGHT_Analysator* const analysator;
};

bool useFloat(const P<IAudioSource>& source) {
    const auto samples = peru::interfaceCast<IFloatSamples>(source);
    for (const int bytes : {4, 8}) {
        if (!samples || !samples->canUseFloat(bytes)) continue;
        samples->useFloat(bytes);
        return true;
    }
    return false;
}

// Empty after TONEWRIGHT_DISCARD.
P<CMeasurement> measure(const P<IAudioSource>& source, TONEWRIGHT_LoudnessProgress callback, void* user) {
    if (!source->isOpened()) source->open();
    const sonora2::common::CCloseGuard closing(*source);
    const bool isFloat = useFloat(source);
    const auto measurement = peru::make<CMeasurement>(isFloat, source->getChannelCount(),
                                                      source->getBytesPerSample(), source->getSampleRate());
    const double duration = source->getDuration();
    while (!source->isEOF()) {
        const P<sonora2::audio::IAudioChunk> chunk = source->getNextAudioChunk();
        if (!chunk) break;
        const double fraction = duration > 0.0 ? chunk->getTimestamp() / duration : 0.0;
        const int32_t answer = callback ? callback(fraction, user) : TONEWRIGHT_CONTINUE;
        if (answer == TONEWRIGHT_DISCARD) return nullptr;
        if (answer == TONEWRIGHT_STOP) break;
        measurement->add(*chunk);
    }
    source->close();
    measurement->tools->finish(measurement->analysator);
    return measurement;
}

} // namespace

TONEWRIGHT_Handle TONEWRIGHT_Host_MeasureLoudness(TONEWRIGHT_Handle source,
                                                  TONEWRIGHT_LoudnessProgress callback, void* user) {
    return guard<TONEWRIGHT_Handle>(nullptr, [&] {
        return wrap(measure(require<IAudioSource>(source, "an audio source"), callback, user));
    });
}

int32_t TONEWRIGHT_Host_GetLoudness(const TONEWRIGHT_Handle* measurements, int32_t count,
                                    TONEWRIGHT_Loudness* loudness) {
    return guard(0, [&] {
        if (!measurements || count < 1)
            throw peru::CError(
                peru::localize("tonewright.Loudness.noMeasurements", "There are no measurements"));
        TONEWRIGHT_Loudness values = {};
        std::vector<P<CMeasurement>> objects;
        std::vector<TONEWRIGHT_Analysator*> analysators;
        for (int32_t i = 0; i < count; ++i) {
            const auto object = require<CMeasurement>(measurements[i], "a measurement of loudness");
            double samplePeak = 0.0, truePeak = 0.0;
            object->tools->getPeaks(object->analysator, &samplePeak, &truePeak);
            values.samplePeak = std::max(values.samplePeak, samplePeak);
            values.truePeak = std::max(values.truePeak, truePeak);
            analysators.push_back(object->analysator);
            objects.push_back(object);
        }
        values.integrated = objects.front()->tools->getLoudness(analysators.data(), count);
        values.range = objects.front()->tools->getRange(analysators.data(), count);
        if (std::isnan(values.integrated) || std::isnan(values.range)) throw std::bad_alloc();
        fillRecord(loudness, values);
        return 1;
    });
}

TONEWRIGHT_Handle TONEWRIGHT_Host_CreateGainSource(TONEWRIGHT_Handle source, double gain,
                                                   int32_t bytesPerSample) {
    return guard<TONEWRIGHT_Handle>(nullptr, [&] {
        if (!std::isfinite(gain) || gain < 0.0 || bytesPerSample < 0 || bytesPerSample > 4)
            throw peru::CError(peru::localize("tonewright.Loudness.gain",
                                              "The gain or the width of the samples is invalid"));
        return wrap(peru::make<CGainSource>(require<IAudioSource>(source, "an audio source"), gain,
                                            static_cast<int>(bytesPerSample)));
    });
}

// Measures loudness and applies gains.
#include "host_support/GainSource.h"
#include "host_support/Guard.h"
#include "host_support/PeakMeter.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"
#include "peru/threads/OrderedParts.h"
#include "sonora2/media/CloseGuard.h"

#include <algorithm>
#include <cmath>
#include <deque>
#include <new>
#include <optional>
#include <utility>
#include <vector>

using namespace tonewright::host_support;
using sonora2::common::IAudioSource;
using sonora2::common::IFloatSamples;

namespace {

// Chunks read before the threads are divided, so that jobs that start side by side know of each other, and
// short sound starts no thread.
constexpr size_t kFirstChunks = 4;
constexpr int kMostThreads = 8;

class CMeasurement : public peru::CObject {
public:
    // Threads beside the calling one measure the peaks; with 0, everything is measured in one pass.
    CMeasurement(const P<CAudioTools>& audioTools, const SAnalysedFormat& format, int helpers)
        : tools(audioTools), analysator(tools->create(TONEWRIGHT_ANALYSATOR_RANGE |
                                                      (helpers > 0 ? 0 : TONEWRIGHT_ANALYSATOR_PEAKS) |
                                                      (format.isFloat ? TONEWRIGHT_ANALYSATOR_FLOAT : 0))) {
        if (!analysator) throw std::bad_alloc();
        analysator->operations->initialise(analysator.get(), format.channels, format.bytesPerSample,
                                           format.rate);
        if (std::isnan(analysator->operations->result(analysator.get())))
            throw peru::CError(
                peru::localize("tonewright.Loudness.format",
                               "The loudness of %CHANNELS% channels at %RATE% Hz cannot be measured",
                               {{"%CHANNELS%", peru::format("%d", format.channels)},
                                {"%RATE%", peru::format("%d", format.rate)}}));
        if (helpers > 0) m_meter.emplace(tools, format, helpers);
    }
    ~CMeasurement() override = default;

    void add(sonora2::audio::IAudioChunk& chunk) {
        if (m_meter) m_meter->add(chunk.getData(), chunk.getSize());
        analysator->operations->analyse(analysator.get(), chunk.getData(), chunk.getSize());
    }
    void finish() {
        if (m_meter) m_meter->finish(samplePeak, truePeak);
        m_meter.reset();
        tools->getPeaks(analysator.get(), &samplePeak, &truePeak); // changes nothing without peaks
        tools->finish(analysator.get());
    }

    const P<CAudioTools> tools;
    const Analysator analysator;
    double samplePeak = 0.0, truePeak = 0.0; // once finished

private:
    std::optional<CPeakMeter> m_meter;
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
    const SAnalysedFormat format{isFloat, source->getChannelCount(), source->getBytesPerSample(),
                                 source->getSampleRate()};
    const double duration = source->getDuration();
    const peru::CThreadShare share;
    std::deque<P<sonora2::audio::IAudioChunk>> first;
    while (first.size() < kFirstChunks && !source->isEOF()) {
        P<sonora2::audio::IAudioChunk> chunk = source->getNextAudioChunk();
        if (!chunk) break;
        first.push_back(std::move(chunk));
    }
    const auto tools = peru::make<CAudioTools>();
    const bool isLong = first.size() == kFirstChunks && tools->forgetPeaks;
    const peru::CIdleThreads idle(isLong ? kMostThreads - 1 : 0);
    const auto measurement = peru::make<CMeasurement>(tools, format, idle.getCount());
    while (!first.empty() || !source->isEOF()) {
        P<sonora2::audio::IAudioChunk> chunk;
        if (first.empty()) {
            chunk = source->getNextAudioChunk();
        } else {
            chunk = std::move(first.front());
            first.pop_front();
        }
        if (!chunk) break;
        // The duration may be an estimate.
        const double fraction = duration > 0.0 ? std::clamp(chunk->getTimestamp() / duration, 0.0, 1.0) : 0.0;
        const int32_t answer = callback ? callback(fraction, user) : TONEWRIGHT_CONTINUE;
        if (answer == TONEWRIGHT_DISCARD) return nullptr;
        if (answer == TONEWRIGHT_STOP) break;
        measurement->add(*chunk);
    }
    source->close();
    measurement->finish();
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
            values.samplePeak = std::max(values.samplePeak, object->samplePeak);
            values.truePeak = std::max(values.truePeak, object->truePeak);
            analysators.push_back(object->analysator.get());
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

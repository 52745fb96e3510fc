#include "peru/Errors.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "sonora2/context/LastFailure.h"
#include "tonewright/EditorXml.h"
#include "tonewright/RecordingAudioSource.h"
#include "tonewright/StepReader.h"
#include "tonewright/TracklistAudioSource.h"
#include "tonewright/exports/AppReference.h"
#include "tonewright/exports/Barrier.h"
#include "tonewright/exports/Handles.h"

#include <cmath>
#include <limits>

using namespace tonewright;
using namespace tonewright::exports;
using sonora2::common::IAudioSource;

namespace {

// Frames between two steps of a waveform. Throws CError for a step of less than one frame or of more than one
// chunk can hold.
int getFramesPerStep(IAudioSource& source, double secondsPerStep) {
    const double frames = source.getSampleRate() * secondsPerStep;
    const int limit = std::numeric_limits<int32_t>::max() / (2 * source.getChannelCount());
    if (frames >= 1.0 && frames < limit) return static_cast<int>(frames);
    throw peru::CError(
        peru::format({"tonewright.FetchStreamSamples.step",
                      "TONEWRIGHT_AudioSource_FetchStreamSamples: a step of %g seconds cannot be taken"},
                     secondsPerStep));
}

// True at the end of the source, false if the callback ended it.
bool fetchSamples(TONEWRIGHT_Handle handle, const P<IAudioSource>& source,
                  TONEWRIGHT_SamplesCallback callback, double secondsPerStep, void* user) {
    const P<sonora2::common::ISonoraContext> context = requireApp()->getReadContext();
    const int channels = source->getChannelCount();
    if (channels < 1)
        throw peru::CError(
            peru::localize("tonewright.FetchStreamSamples.noChannel",
                           "TONEWRIGHT_AudioSource_FetchStreamSamples: a source of no channel"));
    const double duration = source->getDuration();
    return CStepReader(context, source, getFramesPerStep(*source, secondsPerStep),
                       [&](const auto& block) {
                           const double fraction = duration > 0.0 ? block.time / duration : 0.0;
                           return callback(handle, fraction, block.samples, block.count, user);
                       })
        .read();
}

} // namespace

TONEWRIGHT_Handle TONEWRIGHT_CreateAudioSourceFromURI(const char16_t* uri, int32_t sampleRate,
                                                      int32_t channelCount, int32_t bytesPerSample,
                                                      int32_t keepOpened) {
    return barrier<TONEWRIGHT_Handle>(nullptr, [&] {
        const P<CApp> app = requireApp();
        sonora2::common::clearLastFailure();
        const P<IAudioSource> source = app->getReadPluginHandler()->createAudioSource(
            toURI(uri), sampleRate, channelCount, bytesPerSample, keepOpened != 0);
        if (!source) reportLastFailure();
        return wrap(source);
    });
}

TONEWRIGHT_Handle TONEWRIGHT_CreateAudioSourceFromEditorXml(const char16_t* xml, int32_t sampleRate,
                                                            int32_t channelCount, int32_t bytesPerSample) {
    return barrier<TONEWRIGHT_Handle>(nullptr, [&] {
        const P<CApp> app = requireApp();
        return wrap(CTracklistAudioSource::create(readEditorXml(toString(xml)), app->getReadPluginHandler(),
                                                  app->getReadContext()->getLogManager(), sampleRate,
                                                  channelCount, bytesPerSample));
    });
}

TONEWRIGHT_Handle TONEWRIGHT_CreateAudioSoureFromAudioInDevice(TONEWRIGHT_Handle device, int32_t sampleRate,
                                                               int32_t channelCount, int32_t bytesPerSample) {
    return barrier<TONEWRIGHT_Handle>(nullptr, [&]() -> TONEWRIGHT_Handle {
        const P<peru::media::IAudioInDevice> object = unwrap<peru::media::IAudioInDevice>(device);
        if (!object) return nullptr;
        const auto source =
            peru::make<CRecordingAudioSource>(object, sampleRate, channelCount, bytesPerSample);
        if (!source->isValid()) return nullptr;
        return wrap(source);
    });
}

uint8_t TONEWRIGHT_AudioSource_IsOpened(TONEWRIGHT_Handle source) {
    return barrier<uint8_t>(0, [&]() -> uint8_t {
        peru::CMutexLock lock(requireApp()->getServiceLock());
        const P<IAudioSource> object = unwrap<IAudioSource>(source);
        return object && object->isOpened() ? 1 : 0;
    });
}

int32_t TONEWRIGHT_AudioSource_Open(TONEWRIGHT_Handle source) {
    return barrier<int32_t>(TONEWRIGHT_AUDIO_FAILED, [&] {
        peru::CMutexLock lock(requireApp()->getServiceLock());
        const P<IAudioSource> object = unwrap<IAudioSource>(source);
        if (!object) return TONEWRIGHT_AUDIO_FAILED;
        object->open();
        return TONEWRIGHT_OK;
    });
}

int32_t TONEWRIGHT_AudioSource_Close(TONEWRIGHT_Handle source) {
    return barrier<int32_t>(TONEWRIGHT_AUDIO_FAILED, [&] {
        peru::CMutexLock lock(requireApp()->getServiceLock());
        const P<IAudioSource> object = unwrap<IAudioSource>(source);
        if (!object) return TONEWRIGHT_AUDIO_FAILED;
        object->close();
        return TONEWRIGHT_OK;
    });
}

double TONEWRIGHT_AudioSource_GetDuration(TONEWRIGHT_Handle source) {
    return barrier<double>(-1.0, [&] {
        peru::CMutexLock lock(requireApp()->getServiceLock());
        const P<IAudioSource> object = unwrap<IAudioSource>(source);
        return object ? object->getDuration() : -1.0;
    });
}

void TONEWRIGHT_AudioSource_SetRecordingCallback(TONEWRIGHT_Handle source,
                                                 TONEWRIGHT_RecordingCallback callback) {
    barrier([&] {
        if (const auto object = unwrap<CRecordingAudioSource>(source)) object->setRecordingCallback(callback);
    });
}

void TONEWRIGHT_AudioSource_SetRecordingVolumeCallback(TONEWRIGHT_Handle source,
                                                       TONEWRIGHT_RecordingVolumeCallback callback) {
    barrier([&] {
        if (const auto object = unwrap<CRecordingAudioSource>(source)) object->setVolumeCallback(callback);
    });
}

uint8_t TONEWRIGHT_AudioSource_FetchStreamSamples(TONEWRIGHT_Handle source,
                                                  TONEWRIGHT_SamplesCallback callback, double secondsPerStep,
                                                  void* user) {
    return barrier<uint8_t>(0, [&]() -> uint8_t {
        const P<IAudioSource> object = unwrap<IAudioSource>(source);
        if (!object || !callback) return 0;
        if (!object->isOpened()) object->open();
        if (object->getBytesPerSample() != 2) return 0;
        return fetchSamples(source, object, callback, secondsPerStep, user) ? 1 : 0;
    });
}

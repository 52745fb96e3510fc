#include "sonora2/context/LastFailure.h"
#include "sonora2/media/IAudioFormat.h"
#include "tonewright/exports/AppReference.h"
#include "tonewright/exports/Barrier.h"
#include "tonewright/exports/Handles.h"

using namespace tonewright;
using namespace tonewright::exports;
using sonora2::common::IAudioFormat;

TONEWRIGHT_Handle TONEWRIGHT_CreateAudioFormatFromURI(const char16_t* uri, int32_t sampleRate,
                                                      int32_t channelCount, int32_t bytesPerSample,
                                                      double quality, int32_t nominalBitRate,
                                                      int32_t minBitRate, int32_t maxBitRate) {
    return barrier<TONEWRIGHT_Handle>(nullptr, [&]() -> TONEWRIGHT_Handle {
        const P<CApp> app = requireApp();
        sonora2::common::clearLastFailure();
        const P<IAudioFormat> format = app->getWritePluginHandler()->createAudioFormat(
            toURI(uri), sampleRate, channelCount, bytesPerSample);
        if (!format) {
            reportLastFailure();
            return nullptr;
        }
        if (quality > 0.0) format->setAudioQuality(quality);
        if (nominalBitRate > 0 || minBitRate > 0 || maxBitRate > 0)
            format->setAudioBitRate(nominalBitRate, minBitRate, maxBitRate);
        return wrap(format);
    });
}

uint8_t TONEWRIGHT_AudioFormat_IsOpened(TONEWRIGHT_Handle format) {
    return barrier<uint8_t>(0, [&]() -> uint8_t {
        const P<IAudioFormat> object = unwrap<IAudioFormat>(format);
        return object && object->isOpened() ? 1 : 0;
    });
}

int32_t TONEWRIGHT_AudioFormat_Open(TONEWRIGHT_Handle format) {
    return barrier<int32_t>(TONEWRIGHT_AUDIO_FORMAT_OPEN_FAILED, [&] {
        const P<IAudioFormat> object = unwrap<IAudioFormat>(format);
        if (!object) return TONEWRIGHT_AUDIO_FORMAT_OPEN_FAILED;
        object->open();
        return TONEWRIGHT_OK;
    });
}

int32_t TONEWRIGHT_AudioFormat_Close(TONEWRIGHT_Handle format) {
    return barrier<int32_t>(TONEWRIGHT_AUDIO_FAILED, [&] {
        const P<IAudioFormat> object = unwrap<IAudioFormat>(format);
        if (!object) return TONEWRIGHT_AUDIO_FAILED;
        object->close();
        return TONEWRIGHT_OK;
    });
}

int64_t TONEWRIGHT_AudioFormat_GetEstiamtedFileSize(TONEWRIGHT_Handle format, double duration) {
    return barrier<int64_t>(-1, [&]() -> int64_t {
        const P<IAudioFormat> object = unwrap<IAudioFormat>(format);
        return object ? object->getEstimatedSizeBytes(duration) : -1;
    });
}

#include "tonewright/exports/AppReference.h"

using namespace tonewright::exports;

int32_t TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(TONEWRIGHT_Handle, TONEWRIGHT_Handle, int32_t) {
    return notAvailable<int32_t>("TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource",
                                 TONEWRIGHT_AUDIO_CD_PROJECT_FAILED);
}

int32_t TONEWRIGHT_DataDiscProject_AddFileFromAudioSource(TONEWRIGHT_Handle, const char16_t*,
                                                          const char16_t*) {
    return notAvailable<int32_t>("TONEWRIGHT_DataDiscProject_AddFileFromAudioSource",
                                 TONEWRIGHT_DATA_DISC_PROJECT_FAILED);
}

#include "tonewright/EncoderHandle.h"
#include "tonewright/exports/AppReference.h"
#include "tonewright/exports/Barrier.h"
#include "tonewright/exports/Handles.h"

using namespace tonewright;
using namespace tonewright::exports;
using sonora2::common::CAudioEncoder;
using sonora2::common::IAudioFormat;
using sonora2::common::IAudioSource;

TONEWRIGHT_Handle TONEWRIGHT_CreateAudioEncoder(TONEWRIGHT_Handle source, TONEWRIGHT_Handle format) {
    return barrier<TONEWRIGHT_Handle>(nullptr, [&]() -> TONEWRIGHT_Handle {
        const P<IAudioSource> from = unwrap<IAudioSource>(source);
        const P<IAudioFormat> to = unwrap<IAudioFormat>(format);
        if (!from || !to) return nullptr;
        return wrap(peru::make<CEncoderHandle>(requireApp()->getWriteContext(), from, to));
    });
}

int32_t TONEWRIGHT_AudioEncoder_Encode(TONEWRIGHT_Handle encoder) {
    int32_t failure = TONEWRIGHT_ENCODER_FAILED;
    return barrier<int32_t>(failure, [&] {
        // Held by this call: the host may destroy its handle meanwhile.
        if (const P<CEncoderHandle> object = unwrap<CEncoderHandle>(encoder)) {
            failure = TONEWRIGHT_ENCODER_RUN_FAILED;
            object->run();
            return TONEWRIGHT_OK;
        }
        // An encoder that the host created itself.
        const P<CAudioEncoder> own = unwrap<CAudioEncoder>(encoder);
        if (!own) return TONEWRIGHT_ENCODER_FAILED;
        failure = TONEWRIGHT_ENCODER_RUN_FAILED;
        own->encode();
        return TONEWRIGHT_OK;
    });
}

int32_t TONEWRIGHT_AudioEncoder_SetCallback(TONEWRIGHT_Handle encoder, TONEWRIGHT_EncoderCallback callback) {
    return barrier<int32_t>(TONEWRIGHT_ENCODER_FAILED, [&] {
        const P<CEncoderHandle> object = unwrap<CEncoderHandle>(encoder);
        if (!object) return TONEWRIGHT_ENCODER_FAILED;
        object->setCallback(callback);
        return TONEWRIGHT_OK;
    });
}

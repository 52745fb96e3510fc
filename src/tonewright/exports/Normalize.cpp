#include "sonora2/media/IAudioSource.h"
#include "tonewright/exports/AppReference.h"
#include "tonewright/exports/Barrier.h"
#include "tonewright/exports/Handles.h"

using namespace tonewright::exports;

namespace {

// Looks like a valid gain; hosts must compare with it.
constexpr double kBadSource = 3.0;

} // namespace

double TONEWRIGHT_INORMALIZE_processAudioSource(TONEWRIGHT_Handle source, double,
                                                TONEWRIGHT_NormalizeCallback) {
    return barrier<double>(0.0, [&] {
        if (!unwrap<sonora2::common::IAudioSource>(source)) return kBadSource;
        return notAvailable("TONEWRIGHT_INORMALIZE_processAudioSource", 0.0);
    });
}

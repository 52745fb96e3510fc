#include "sonora2/media/IAudioSource.h"
#include "tonewright/exports/AppReference.h"
#include "tonewright/exports/Barrier.h"
#include "tonewright/exports/Handles.h"

using namespace tonewright::exports;

namespace {

// Looks like a valid gain; hosts must compare with it.
constexpr double kBadSource = 3.0;

} // namespace

double TONEWRIGHT_INORMALIZE_processAudioSource(TONEWRIGHT_Handle source, double targetLevel,
                                                TONEWRIGHT_NormalizeCallback callback) {
    return barrier<double>(0.0, [&] {
        const P<sonora2::common::IAudioSource> object = unwrap<sonora2::common::IAudioSource>(source);
        if (!object) return kBadSource;
        // Held until the end: the library must stay loaded if the application is shut down meanwhile.
        const P<tonewright::CNormalizeHandler> handler = requireApp()->getNormalizeHandler();
        return handler->findGain(*object, targetLevel,
                                 [callback](double fraction) { return !callback || callback(fraction); });
    });
}

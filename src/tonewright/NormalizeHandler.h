// The library that measures loudness for the exports.
#pragma once

#include "peru/system/IDynamicLibrary.h"
#include "sonora2/media/IAudioSource.h"
#include "tonewright/audiotools.h"

#include <functional>

namespace tonewright {

using peru::P;

// Thread-safe.
class CNormalizeHandler : public peru::CObject {
public:
    // Loads the library. Throws CError if it or one of its functions is missing.
    CNormalizeHandler();
    ~CNormalizeHandler() override;

    // Measures a source from its current position and returns the factor that brings it to that level. Opens
    // the source if necessary and leaves it open. If `goesOn` returns false for the fraction done, the part
    // measured so far counts. Throws CError for a format that cannot be measured.
    double findGain(sonora2::common::IAudioSource& source, double targetLevel,
                    const std::function<bool(double)>& goesOn) const;

private:
    const P<peru::IDynamicLibrary> m_library;
    decltype(createNormalizeAnalysator)* const m_create;
    decltype(convertDeltaDBValue)* const m_convert;
};

} // namespace tonewright

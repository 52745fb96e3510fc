// The functions that measure loudness.
#pragma once

#include "peru/Object.h"
#include "sonora2/plugins/CompanionLibrary.h"
#include "tonewright/audiotools.h"

#include <memory>

namespace tonewright::host_support {

using peru::P;

// Loads the library. Held by everything that uses it.
class CAudioTools : public peru::CObject {
public:
    CAudioTools()
        : m_library(sonora2::common::loadCompanionLibrary("audiotools")),
          create(find<decltype(createLoudnessAnalysator)>("createLoudnessAnalysator")),
          getPeaks(find<decltype(getAnalysatorPeaks)>("getAnalysatorPeaks")),
          getLoudness(find<decltype(getAnalysatorLoudness)>("getAnalysatorLoudness")),
          getRange(find<decltype(getAnalysatorRange)>("getAnalysatorRange")),
          finish(find<decltype(finishAnalysator)>("finishAnalysator")),
          forgetPeaks(reinterpret_cast<decltype(forgetAnalysatorPeaks)*>(
              m_library->findSymbol("forgetAnalysatorPeaks"))) {}
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
    decltype(forgetAnalysatorPeaks)* const forgetPeaks; // null in a library that lacks it
};

struct SAnalysedFormat {
    bool isFloat;
    int channels;
    int bytesPerSample;
    int rate;
};

struct SAnalysatorEnd {
    void operator()(TONEWRIGHT_Analysator* analysator) const { analysator->operations->destroy(analysator); }
};
using Analysator = std::unique_ptr<TONEWRIGHT_Analysator, SAnalysatorEnd>;

} // namespace tonewright::host_support

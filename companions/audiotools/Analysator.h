// Measures loudness and peaks.
#pragma once

#include "tonewright/audiotools.h"

#include <cstddef>
#include <ebur128.h>
#include <memory>
#include <span>
#include <vector>

namespace audiotools {

// Functions may throw std::bad_alloc. An object that threw must be initialised again.
class CAnalysator : public TONEWRIGHT_Analysator {
public:
    explicit CAnalysator(int flags);

    void initialise(int channelCount, int bytesPerSample, int sampleRate);
    void analyse(const uint8_t* bytes, size_t count);
    // Results from now on are those of a format that cannot be measured.
    void invalidate() { m_state.reset(); }
    // False without peaks.
    bool getPeaks(double& samplePeak, double& truePeak) const;

    // The loudness of all together, in LUFS.
    static double measure(std::span<const CAnalysator* const> analysators);

private:
    struct SEnd {
        void operator()(ebur128_state* state) const { ebur128_destroy(&state); }
    };
    using State = std::unique_ptr<ebur128_state, SEnd>;

    State makeState(int channelCount, int sampleRate) const;
    void addFrames(const uint8_t* bytes, size_t frames);
    template <class Sample, class Convert>
    void addConverted(std::vector<Sample>& block, const uint8_t* bytes, size_t frames, Convert convert);
    template <class Sample> void addAligned(std::vector<Sample>& block, const uint8_t* bytes, size_t frames);

    const bool m_hasPeaks;
    const bool m_isFloat;
    State m_state;
    size_t m_channels = 0;
    size_t m_bytesPerSample = 0;
    std::vector<uint8_t> m_partial; // the beginning of a frame
    // Blocks of samples that the measurement cannot read in place.
    std::vector<short> m_shorts;
    std::vector<int> m_integers;
    std::vector<float> m_floats;
    std::vector<double> m_doubles;
};

} // namespace audiotools

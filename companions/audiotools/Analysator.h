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
    // No more samples follow: releases what only they would need. The results stay.
    void finish();
    // Results from now on are those of a format that cannot be measured.
    void invalidate() { m_state.reset(); }
    // The peaks from here on. False without peaks.
    bool forgetPeaks();
    // False without peaks.
    bool getPeaks(double& samplePeak, double& truePeak) const;

    // The loudness of all together, in LUFS.
    static double measure(std::span<const CAnalysator* const> analysators);
    // The loudness range of all together, in LU. NaN unless all measure it.
    static double measureRange(std::span<const CAnalysator* const> analysators);

private:
    struct SEnd {
        void operator()(ebur128_state* state) const { ebur128_destroy(&state); }
    };
    using State = std::unique_ptr<ebur128_state, SEnd>;

    State makeState(int channelCount, int sampleRate) const;
    // Empty if one of them has none.
    static std::vector<ebur128_state*> listStates(std::span<const CAnalysator* const> analysators);
    void addFrames(const uint8_t* bytes, size_t frames);
    template <class Sample> void add(const Sample* samples, size_t frames);
    template <class Read> double findPeak(Read read) const; // the highest of all channels
    template <class Sample, class Convert>
    void addConverted(std::vector<Sample>& block, const uint8_t* bytes, size_t frames, Convert convert);
    template <class Sample> void addAligned(std::vector<Sample>& block, const uint8_t* bytes, size_t frames);

    const bool m_hasPeaks;
    const bool m_isFloat;
    const bool m_hasRange;
    State m_state;
    bool m_isFinished = false;
    bool m_hasForgotten = false;                 // peaks; those since then are collected here
    double m_samplePeak = 0.0, m_truePeak = 0.0; // if so, or once finished
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

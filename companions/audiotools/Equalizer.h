// Ten peaking filters in a row.
#pragma once

#include "tonewright/audiotools.h"

#include <array>
#include <cstddef>
#include <vector>

namespace audiotools {

// Functions may throw std::bad_alloc.
class CEqualizer : public TONEWRIGHT_Equalizer {
public:
    CEqualizer();

    void configure(int sampleRate, int bytesPerSample, int channelCount);
    void select(int preset);
    void process(uint8_t* bytes, size_t count);

private:
    struct SFilter {
        double b0, b1, b2, a1, a2; // a0 is 1
    };
    struct SState {
        double s1 = 0.0, s2 = 0.0;
    };

    void update();
    SState* stateOf(size_t filter, size_t channel) {
        return m_states.data() + m_bands[filter] * m_channels + channel;
    }
    void filterBlock(size_t frames);
    template <size_t Filters, size_t Channels> void run(size_t first, size_t channel, size_t frames);

    int m_sampleRate = 0;
    size_t m_bytesPerSample = 0; // 0: nothing is changed
    size_t m_channels = 0;
    int m_preset = 0;
    std::vector<SFilter> m_filters; // of the bands that are not at 0 dB
    std::vector<size_t> m_bands;    // ... and which these are
    std::vector<SState> m_states;   // of all bands, grouped by band
    std::vector<double> m_block;
};

} // namespace audiotools

#include "Equalizer.h"
#include "EqualizerPresets.h"

#include <algorithm>
#include <cmath>
#include <cstring>

namespace audiotools {

namespace {

constexpr double kLowestCentre = 31.25; // Hz
constexpr double kQuality = 1.41;       // one octave
constexpr size_t kBlockFrames = 512;
constexpr int kMostChannels = 1024;
// The tail of a filter after the sound has ended: far below any sample, but above the range in which
// processors calculate slowly.
constexpr double kInaudible = 1e-30;

// Integers of the samples' own width.
template <size_t Width> double load(const uint8_t* bytes) {
    if constexpr (Width == 1) return *bytes - 128;
    uint32_t value = 0;
    std::memcpy(reinterpret_cast<uint8_t*>(&value) + 4 - Width, bytes, Width);
    return static_cast<int32_t>(value) >> (8 * (4 - Width));
}

template <size_t Width> void store(double sample, uint8_t* bytes) {
    constexpr double kHighest = static_cast<double>((int64_t{1} << (8 * Width - 1)) - 1);
    const int64_t rounded = std::llrint(std::clamp(sample, -kHighest - 1, kHighest));
    const auto value = static_cast<uint32_t>(Width == 1 ? rounded + 128 : rounded);
    std::memcpy(bytes, &value, Width);
}

template <size_t Width> void loadAll(const uint8_t* bytes, double* samples, size_t count) {
    for (size_t i = 0; i < count; ++i) samples[i] = load<Width>(bytes + i * Width);
}

template <size_t Width> void storeAll(const double* samples, uint8_t* bytes, size_t count) {
    for (size_t i = 0; i < count; ++i) store<Width>(samples[i], bytes + i * Width);
}

constexpr decltype(&loadAll<1>) kLoad[] = {loadAll<1>, loadAll<2>, loadAll<3>, loadAll<4>};
constexpr decltype(&storeAll<1>) kStore[] = {storeAll<1>, storeAll<2>, storeAll<3>, storeAll<4>};

} // namespace

CEqualizer::CEqualizer() : TONEWRIGHT_Equalizer() {}

void CEqualizer::configure(int sampleRate, int bytesPerSample, int channelCount) {
    m_bytesPerSample = 0;
    if (sampleRate < 1 || bytesPerSample < 1 || bytesPerSample > 4 || channelCount < 1 ||
        channelCount > kMostChannels)
        return;
    m_sampleRate = sampleRate;
    m_channels = static_cast<size_t>(channelCount);
    m_states.assign(TONEWRIGHT_EQUALIZER_BANDS * m_channels, SState());
    m_block.resize(kBlockFrames * m_channels);
    update();
    m_bytesPerSample = static_cast<size_t>(bytesPerSample);
}

void CEqualizer::select(int preset) {
    m_preset = preset;
    if (m_bytesPerSample > 0) update();
}

// Peaking filters from the bilinear transform, with the frequency axis warped so that the centre is exact.
void CEqualizer::update() {
    m_filters.clear();
    m_bands.clear();
    const SEqualizerPreset* preset = findEqualizerPreset(m_preset);
    for (size_t band = 0; preset && band < TONEWRIGHT_EQUALIZER_BANDS; ++band) {
        const double centre = std::ldexp(kLowestCentre, static_cast<int>(band));
        if (preset->gains[band] == 0.0 || centre >= m_sampleRate / 2.0) continue;
        const double amplitude = std::pow(10.0, preset->gains[band] / 40.0);
        const double angle = 2.0 * M_PI * centre / m_sampleRate;
        const double alpha = std::sin(angle) / (2.0 * kQuality);
        const double a0 = 1.0 + alpha / amplitude;
        const double middle = -2.0 * std::cos(angle) / a0;
        m_filters.push_back({(1.0 + alpha * amplitude) / a0, middle, (1.0 - alpha * amplitude) / a0, middle,
                             (1.0 - alpha / amplitude) / a0});
        m_bands.push_back(band);
    }
    // A band that is not used must not continue later with what it heard before.
    for (size_t band = 0; band < TONEWRIGHT_EQUALIZER_BANDS; ++band)
        if (std::find(m_bands.begin(), m_bands.end(), band) == m_bands.end())
            std::fill_n(m_states.begin() + static_cast<std::ptrdiff_t>(band * m_channels), m_channels,
                        SState());
}

void CEqualizer::process(uint8_t* bytes, size_t count) {
    if (m_bytesPerSample == 0 || m_filters.empty()) return;
    const size_t frameBytes = m_channels * m_bytesPerSample;
    for (size_t frames = count / frameBytes; frames > 0;) {
        const size_t now = std::min(frames, kBlockFrames);
        kLoad[m_bytesPerSample - 1](bytes, m_block.data(), now * m_channels);
        filterBlock(now);
        kStore[m_bytesPerSample - 1](m_block.data(), bytes, now * m_channels);
        bytes += now * frameBytes;
        frames -= now;
    }
}

void CEqualizer::filterBlock(size_t frames) {
    for (size_t first = 0; first < m_filters.size();) {
        const bool isPair = first + 1 < m_filters.size();
        for (size_t channel = 0; channel < m_channels;) {
            const bool isStereo = channel + 1 < m_channels;
            if (isPair)
                isStereo ? run<2, 2>(first, channel, frames) : run<2, 1>(first, channel, frames);
            else
                isStereo ? run<1, 2>(first, channel, frames) : run<1, 1>(first, channel, frames);
            channel += isStereo ? 2 : 1;
        }
        first += isPair ? 2 : 1;
    }
}

// Each result of a filter depends on the one before, so a processor is idle most of the time unless it can
// calculate several filters and channels side by side.
template <size_t Filters, size_t Channels> void CEqualizer::run(size_t first, size_t channel, size_t frames) {
    SFilter filters[Filters];
    SState states[Filters][Channels];
    for (size_t i = 0; i < Filters; ++i) {
        filters[i] = m_filters[first + i];
        std::copy_n(stateOf(first + i, channel), Channels, states[i]);
    }
    double* frame = m_block.data() + channel;
    for (size_t left = frames; left > 0; --left, frame += m_channels)
        for (size_t i = 0; i < Filters; ++i)
            for (size_t k = 0; k < Channels; ++k) {
                SState& state = states[i][k];
                const double in = frame[k], out = filters[i].b0 * in + state.s1;
                state.s1 = filters[i].b1 * in - filters[i].a1 * out + state.s2;
                state.s2 = filters[i].b2 * in - filters[i].a2 * out;
                frame[k] = out;
            }
    for (size_t i = 0; i < Filters; ++i) {
        for (SState& state : states[i])
            if (std::fabs(state.s1) < kInaudible && std::fabs(state.s2) < kInaudible) state = SState();
        std::copy_n(states[i], Channels, stateOf(first + i, channel));
    }
}

} // namespace audiotools

#include "Analysator.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <initializer_list>
#include <limits>
#include <new>

namespace audiotools {

namespace {

constexpr size_t kBlockFrames = 1024;
constexpr size_t kKnownLayouts = 8; // channels
constexpr double kNone = std::numeric_limits<double>::quiet_NaN();

int addFramesOf(ebur128_state* state, const short* samples, size_t frames) {
    return ebur128_add_frames_short(state, samples, frames);
}
int addFramesOf(ebur128_state* state, const int* samples, size_t frames) {
    return ebur128_add_frames_int(state, samples, frames);
}
int addFramesOf(ebur128_state* state, const float* samples, size_t frames) {
    return ebur128_add_frames_float(state, samples, frames);
}
int addFramesOf(ebur128_state* state, const double* samples, size_t frames) {
    return ebur128_add_frames_double(state, samples, frames);
}

// The library's own layouts end at 5.1. Sound files with 7 and 8 channels have the order of WAV: the rear
// channels come before those at the sides, which alone are weighted. Beyond that nothing is known about the
// channels, and all count alike.
void setLayout(ebur128_state* state, size_t channels) {
    const auto set = [state](unsigned first, std::initializer_list<int> places) {
        for (const int place : places) ebur128_set_channel(state, first++, place);
    };
    if (channels == 7) set(4, {EBUR128_Mp180, EBUR128_Mp090, EBUR128_Mm090});
    if (channels == 8) set(4, {EBUR128_Mp135, EBUR128_Mm135, EBUR128_Mp090, EBUR128_Mm090});
    if (channels > kKnownLayouts)
        for (unsigned i = 0; i < channels; ++i) ebur128_set_channel(state, i, EBUR128_CENTER);
}

template <class Sample> Sample readFinite(const uint8_t* bytes) {
    Sample sample;
    std::memcpy(&sample, bytes, sizeof sample);
    return std::isfinite(sample) ? sample : Sample{0};
}

int read24(const uint8_t* bytes) {
    return static_cast<int>(uint32_t{bytes[0]} << 8 | uint32_t{bytes[1]} << 16 | uint32_t{bytes[2]} << 24);
}

} // namespace

CAnalysator::CAnalysator(int flags)
    : TONEWRIGHT_Analysator(), m_hasPeaks((flags & TONEWRIGHT_ANALYSATOR_PEAKS) != 0),
      m_isFloat((flags & TONEWRIGHT_ANALYSATOR_FLOAT) != 0),
      m_hasRange((flags & TONEWRIGHT_ANALYSATOR_RANGE) != 0) {}

void CAnalysator::initialise(int channelCount, int bytesPerSample, int sampleRate) {
    m_state.reset();
    m_partial.clear();
    m_isFinished = m_hasForgotten = false;
    const bool isValid =
        m_isFloat ? bytesPerSample == 4 || bytesPerSample == 8 : bytesPerSample >= 1 && bytesPerSample <= 4;
    if (!isValid || channelCount < 1 || sampleRate < 1) return;
    m_channels = static_cast<size_t>(channelCount);
    m_bytesPerSample = static_cast<size_t>(bytesPerSample);
    m_state = makeState(channelCount, sampleRate);
}

CAnalysator::State CAnalysator::makeState(int channelCount, int sampleRate) const {
    const int mode = EBUR128_MODE_I | (m_hasPeaks ? EBUR128_MODE_TRUE_PEAK | EBUR128_MODE_SAMPLE_PEAK : 0) |
                     (m_hasRange ? EBUR128_MODE_LRA : 0);
    State state(
        ebur128_init(static_cast<unsigned>(channelCount), static_cast<unsigned long>(sampleRate), mode));
    if (state) setLayout(state.get(), m_channels);
    return state;
}

void CAnalysator::analyse(const uint8_t* bytes, size_t count) {
    if (!m_state || m_isFinished) return;
    const size_t frameBytes = m_channels * m_bytesPerSample;
    if (!m_partial.empty()) {
        const size_t taken = std::min(count, frameBytes - m_partial.size());
        m_partial.insert(m_partial.end(), bytes, bytes + taken);
        bytes += taken;
        count -= taken;
        if (m_partial.size() < frameBytes) return;
        addFrames(m_partial.data(), 1);
        m_partial.clear();
    }
    const size_t frames = count / frameBytes;
    if (frames > 0) addFrames(bytes, frames);
    m_partial.assign(bytes + frames * frameBytes, bytes + count);
}

template <class Sample> void CAnalysator::add(const Sample* samples, size_t frames) {
    if (addFramesOf(m_state.get(), samples, frames) != EBUR128_SUCCESS) throw std::bad_alloc();
    if (!m_hasForgotten) return;
    m_samplePeak = std::max(m_samplePeak, findPeak(ebur128_prev_sample_peak));
    m_truePeak = std::max(m_truePeak, findPeak(ebur128_prev_true_peak));
}

template <class Read> double CAnalysator::findPeak(Read read) const {
    double highest = 0.0, peak = 0.0;
    for (unsigned channel = 0; channel < m_channels; ++channel)
        if (read(m_state.get(), channel, &peak) == EBUR128_SUCCESS) highest = std::max(highest, peak);
    return highest;
}

bool CAnalysator::forgetPeaks() {
    if (!m_hasPeaks || !m_state || m_isFinished) return false;
    m_hasForgotten = true;
    m_samplePeak = m_truePeak = 0.0;
    return true;
}

void CAnalysator::addFrames(const uint8_t* bytes, size_t frames) {
    if (m_isFloat && m_bytesPerSample == sizeof(float))
        addConverted(m_floats, bytes, frames, readFinite<float>);
    else if (m_isFloat)
        addConverted(m_doubles, bytes, frames, readFinite<double>);
    else if (m_bytesPerSample == 1)
        addConverted(m_shorts, bytes, frames,
                     [](const uint8_t* sample) { return static_cast<short>((*sample - 128) * 256); });
    else if (m_bytesPerSample == sizeof(short))
        addAligned(m_shorts, bytes, frames);
    else if (m_bytesPerSample == 3)
        addConverted(m_integers, bytes, frames, read24);
    else
        addAligned(m_integers, bytes, frames);
}

template <class Sample, class Convert> void
CAnalysator::addConverted(std::vector<Sample>& block, const uint8_t* bytes, size_t frames, Convert convert) {
    block.resize(kBlockFrames * m_channels);
    while (frames > 0) {
        const size_t now = std::min(frames, kBlockFrames);
        for (size_t i = 0; i < now * m_channels; ++i) block[i] = convert(bytes + i * m_bytesPerSample);
        add(block.data(), now);
        bytes += now * m_channels * m_bytesPerSample;
        frames -= now;
    }
}

// Reads the samples in place if they are aligned, as those of most chunks are.
template <class Sample>
void CAnalysator::addAligned(std::vector<Sample>& block, const uint8_t* bytes, size_t frames) {
    if (reinterpret_cast<uintptr_t>(bytes) % alignof(Sample) == 0)
        return add(reinterpret_cast<const Sample*>(bytes), frames);
    addConverted(block, bytes, frames, [](const uint8_t* from) {
        Sample sample;
        std::memcpy(&sample, from, sizeof sample);
        return sample;
    });
}

// The library has no such operation, but a change of the format releases all buffers and keeps what has been
// measured, except for the peaks.
void CAnalysator::finish() {
    if (!m_state || m_isFinished) return;
    getPeaks(m_samplePeak, m_truePeak);
    m_isFinished = true;
    m_partial = {};
    m_shorts = {};
    m_integers = {};
    m_floats = {};
    m_doubles = {};
    constexpr unsigned kLeastChannels = 1, kLeastRate = 16;
    if (ebur128_change_parameters(m_state.get(), kLeastChannels, kLeastRate) == EBUR128_ERROR_NOMEM)
        throw std::bad_alloc();
}

bool CAnalysator::getPeaks(double& samplePeak, double& truePeak) const {
    if (!m_hasPeaks || !m_state) return false;
    const bool isCollected = m_isFinished || m_hasForgotten;
    samplePeak = isCollected ? m_samplePeak : findPeak(ebur128_sample_peak);
    truePeak = std::max(isCollected ? m_truePeak : findPeak(ebur128_true_peak), samplePeak);
    return true;
}

std::vector<ebur128_state*> CAnalysator::listStates(std::span<const CAnalysator* const> analysators) {
    std::vector<ebur128_state*> states;
    for (const CAnalysator* analysator : analysators) {
        if (!analysator->m_state) return {};
        states.push_back(analysator->m_state.get());
    }
    return states;
}

double CAnalysator::measure(std::span<const CAnalysator* const> analysators) {
    std::vector<ebur128_state*> states = listStates(analysators);
    double loudness = kNone;
    if (states.empty() ||
        ebur128_loudness_global_multiple(states.data(), states.size(), &loudness) != EBUR128_SUCCESS)
        return kNone;
    return loudness;
}

double CAnalysator::measureRange(std::span<const CAnalysator* const> analysators) {
    std::vector<ebur128_state*> states = listStates(analysators);
    double range = kNone;
    if (states.empty() ||
        ebur128_loudness_range_multiple(states.data(), states.size(), &range) != EBUR128_SUCCESS)
        return kNone;
    return range;
}

} // namespace audiotools

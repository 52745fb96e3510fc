// Sources of known noise, and a straightforward mixer to compare with.
#pragma once

#include "sonora2/ScriptedMedia.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/tracks/AudioTrack.h"
#include "sonora2/tracks/AudioTracklist.h"

#include <atomic>
#include <cmath>

namespace tests {

using Samples = std::vector<int16_t>;

inline int16_t noiseAt(int seed, int64_t frame, int channel) {
    uint64_t x =
        static_cast<uint64_t>(frame) * 8 + static_cast<uint64_t>(channel) + (uint64_t{1} << 40) * seed;
    x = (x ^ (x >> 31)) * 0x9E3779B97F4A7C15u;
    x = (x ^ (x >> 29)) * 0xBF58476D1CE4E5B9u;
    return static_cast<int16_t>(x >> 40);
}

inline void append(Samples& samples, const P<sonora2::audio::IAudioChunk>& chunk) {
    const auto* data = reinterpret_cast<const int16_t*>(chunk->getData());
    samples.insert(samples.end(), data, data + chunk->getSize() / sizeof(int16_t));
}

struct SNoise {
    int seed = 1;
    int64_t frames = 8000;
    int rate = 8000;
    int channels = 1;
    std::vector<int> cuts{700, 1, 1300};  // frames per chunk, repeatedly
    std::function<void()> onOpen = [] {}; // may throw
};

class CNoiseSource : public CSourceBase {
public:
    explicit CNoiseSource(const SNoise& noise) : m_noise(noise) {}
    ~CNoiseSource() override {
        if (m_opened) --s_open;
    }

    static inline std::atomic<int> s_open{0};

    void open() override {
        m_noise.onOpen();
        ++opens;
        if (!m_opened) ++s_open;
        m_opened = true;
        m_position = 0;
        m_cut = 0;
    }
    void close() override {
        if (m_opened) --s_open;
        m_opened = false;
    }
    void skipToTime(double time) override { m_position = std::llround(time * m_noise.rate); }
    double getDuration() override { return static_cast<double>(m_noise.frames) / m_noise.rate; }
    int getBufferStatus() override { return 100 - m_noise.seed; }
    bool isEOF() override { return m_position >= m_noise.frames; }
    P<sonora2::audio::IAudioChunk> getNextAudioChunk() override {
        if (!m_opened) throw peru::CError("read while closed");
        if (isEOF()) return nullptr;
        const int64_t frames =
            std::min<int64_t>(m_noise.cuts[m_cut++ % m_noise.cuts.size()], m_noise.frames - m_position);
        P<peru::IMemoryBlock> block = peru::make<peru::CMemoryBlock>(frames * m_noise.channels * 2);
        auto* sample = reinterpret_cast<int16_t*>(block->getData());
        for (int64_t f = 0; f < frames; ++f)
            for (int c = 0; c < m_noise.channels; ++c) *sample++ = noiseAt(m_noise.seed, m_position + f, c);
        const double timestamp = static_cast<double>(m_position) / m_noise.rate;
        m_position += frames;
        return peru::make<sonora2::audio::CAudioChunk>(timestamp, block);
    }
    int getSampleRate() override { return m_noise.rate; }
    int getChannelCount() override { return m_noise.channels; }
    int getBytesPerSample() override { return 2; }

private:
    SNoise m_noise;
    int64_t m_position = 0;
    size_t m_cut = 0;
};

// The mixing rule, written literally.
inline int16_t mixPlain(int a, int b) {
    if (a < 0 && b < 0) return static_cast<int16_t>(b + a + a * b / 32768);
    if (a > 0 && b > 0) return static_cast<int16_t>(b + a - a * b / 32767);
    return static_cast<int16_t>(b + a);
}

struct STrackPlan {
    SNoise noise;
    int lane = 0;
    double start = 0.0;
    double end = 1.0;
    bool enabled = true;
    double speed = 0.0;
    std::vector<sonora2::audio::SVolumeChange> changes = {};
};

inline P<sonora2::audio::CAudioTrack> makeTrack(const P<sonora2::common::ISonoraContext>& context,
                                                const STrackPlan& plan) {
    auto track = peru::make<sonora2::audio::CAudioTrack>(context, peru::make<CNoiseSource>(plan.noise), false,
                                                         plan.start, plan.end - plan.start, plan.lane);
    track->setEnabled(plan.enabled);
    track->setSpeed(plan.speed);
    for (const auto& c : plan.changes)
        track->addVolumeChange(c.startFactor, c.endFactor, c.startTime, c.endTime);
    return track;
}

// The output of a track until its source ends: gains per chunk, then the speed.
inline Samples renderTrack(const STrackPlan& plan) {
    auto source = peru::make<CNoiseSource>(plan.noise);
    source->open();
    Samples all;
    P<sonora2::samplerateconverter::CSampleRateConverter> converter;
    while (P<sonora2::audio::IAudioChunk> chunk = source->getNextAudioChunk()) {
        const int channels = plan.noise.channels, rate = plan.noise.rate;
        auto* samples = reinterpret_cast<int16_t*>(chunk->getData());
        const int frames = static_cast<int>(chunk->getSize()) / channels / 2;
        const double t0 = chunk->getTimestamp(), t1 = t0 + static_cast<double>(frames) / rate;
        for (const auto& c : plan.changes) {
            if (t0 < c.startTime || t1 > c.endTime) continue;
            for (int i = 0; i < frames * channels; ++i) {
                const double t = static_cast<double>(i / channels) / rate + t0;
                double factor = c.startFactor;
                if (std::fabs(c.startFactor - c.endFactor) > 0.001)
                    factor += (t - c.startTime) * (c.endFactor - c.startFactor) / (c.endTime - c.startTime);
                samples[i] = static_cast<int16_t>(std::clamp(samples[i] * factor, -32768.0, 32767.0));
            }
        }
        if (plan.speed != 0.0) {
            if (!converter)
                converter = peru::make<sonora2::samplerateconverter::CSampleRateConverter>(
                    rate, channels, 2, static_cast<int>(rate / plan.speed), channels, 2);
            chunk = converter->convert(chunk->getData(), static_cast<int>(chunk->getSize()));
        }
        append(all, chunk);
    }
    return all;
}

// The output of a list of these tracks from start to end.
inline Samples renderList(const std::vector<STrackPlan>& plans, int rate, int channels, int stepFrames) {
    const auto frameOf = [](double time) { return std::llround(time * 1000.0); };
    std::vector<const STrackPlan*> order; // by lane, then by start
    for (const STrackPlan& plan : plans) order.push_back(&plan);
    std::stable_sort(order.begin(), order.end(), [&](const STrackPlan* a, const STrackPlan* b) {
        return a->lane != b->lane ? a->lane < b->lane : frameOf(a->start) < frameOf(b->start);
    });
    std::vector<Samples> media;
    std::vector<size_t> positions(order.size());
    int64_t last = 0;
    for (const STrackPlan* plan : order) {
        media.push_back(renderTrack(*plan));
        last = std::max<int64_t>(last, frameOf(plan->end));
    }
    Samples all;
    for (int64_t position = 0; position * 1000 / rate <= last;) {
        const int64_t now = position * 1000 / rate;
        Samples sum(static_cast<size_t>(stepFrames * channels));
        bool playing = false;
        int takenLane = -1000;
        for (size_t i = 0; i < order.size(); ++i) {
            if (order[i]->lane == takenLane || frameOf(order[i]->end) < now) continue;
            takenLane = order[i]->lane; // the lane waits for this one, even if it has not begun
            if (frameOf(order[i]->start) > now || !order[i]->enabled) continue;
            playing = true;
            for (int16_t& sample : sum) {
                const int a = positions[i] < media[i].size() ? media[i][positions[i]] : 0;
                ++positions[i];
                sample = mixPlain(a, sample);
            }
        }
        if (!playing) sum.assign(static_cast<size_t>(rate / 100 * channels), 0);
        all.insert(all.end(), sum.begin(), sum.end());
        position += static_cast<int64_t>(sum.size()) / channels;
    }
    return all;
}

} // namespace tests

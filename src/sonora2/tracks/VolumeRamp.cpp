#include "sonora2/tracks/VolumeRamp.h"

#include "sonora2/tracks/AudioTrack.h"

#include <algorithm>
#include <cmath>

namespace sonora2::audio {

namespace {

constexpr double kMargin = 0.02;    // seconds by which a change is widened
constexpr double kConstant = 0.001; // factors this close count as equal
constexpr int64_t kWholeChunk = 5;  // fewer frames than this are not skipped at a chunk's end

int16_t scale(int16_t sample, double factor) {
    // This order maps NaN to -32768.
    return static_cast<int16_t>(std::min(std::max(-32768.0, sample * factor), 32767.0));
}

int64_t countFrames(double seconds, int rate, int64_t limit) {
    return static_cast<int64_t>(std::clamp(seconds * rate, 0.0, static_cast<double>(limit)));
}

} // namespace

void applyVolumeChange(const SVolumeChange& change, const SRampChunk& chunk) {
    const double t0 = chunk.timestamp;
    const double t1 = t0 + static_cast<double>(chunk.frames) / chunk.rate;
    if (!(change.startTime <= t0 && t1 <= change.endTime)) return;

    const int64_t first = countFrames(change.startTime - kMargin - t0, chunk.rate, chunk.frames);
    const double low = std::max(change.startTime - kMargin, t0);
    const double high = std::min(change.endTime + kMargin, t1);
    int64_t count = countFrames(high - low, chunk.rate, chunk.frames - first);
    if (chunk.frames - count < kWholeChunk) count = chunk.frames;

    const double span = change.endTime - change.startTime;
    const double difference = change.endFactor - change.startFactor;
    const bool isConstant = std::fabs(difference) <= kConstant;
    const int64_t last = std::min(first + count, chunk.frames);
    for (int64_t i = first; i < last; ++i) {
        const double t = static_cast<double>(i) / chunk.rate + t0;
        const double factor =
            isConstant ? change.startFactor : change.startFactor + (t - change.startTime) * difference / span;
        int16_t* frame = chunk.samples + i * chunk.channels;
        for (int channel = 0; channel < chunk.channels; ++channel)
            frame[channel] = scale(frame[channel], factor);
    }
}

} // namespace sonora2::audio

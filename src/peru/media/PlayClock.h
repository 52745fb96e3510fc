// Computes how much of the sound passed to the sound system has been heard.
#pragma once

#include "peru/media/Api.h"

#include <array>
#include <cstddef>
#include <cstdint>

namespace peru::media {

// The sound system takes blocks and reports for each when its first frame will be heard, on a clock with an
// arbitrary start. The number of frames heard at a time is that of all finished blocks plus the played part
// of the current one; gaps between blocks add nothing. So the number never decreases, never exceeds the
// number of frames passed on, and reaches it once the last block has been heard. Not thread-safe; does not
// allocate.
class PERU_MEDIA_API CPlayClock {
public:
    explicit CPlayClock(double framesPerSecond = 1.0) : m_framesPerSecond(framesPerSecond) {}

    // Adds the next block, which is heard from `time` on.
    void add(double time, int64_t frames);
    // Frames heard at `now`. A time before the latest one passed in counts as the latest.
    double getHeard(double now);
    // The same at the latest time passed in.
    double getHeard() { return getHeard(m_now); }
    // The system discarded everything not played by `now`. Later times may be from a different clock.
    void drop(double now);

private:
    struct SBlock {
        double time;
        int64_t frames;
    };
    double getPart(const SBlock& block) const;
    void retireFirst();
    bool extendLast(double time, int64_t frames);

    // The system may take seconds of sound in advance in buffers of a millisecond, so consecutive blocks
    // without a gap are merged. Maximum length of a merged block and tolerance for its start, in seconds.
    static constexpr double kLongestBlock = 0.05;
    static constexpr double kTremble = 0.01;
    // Six seconds, more than any system buffers; beyond that the oldest block counts as heard.
    static constexpr size_t kMostBlocks = 128;

    double m_framesPerSecond;
    double m_now = -1e300;
    double m_heard = 0.0;                     // frames of blocks removed from the ring
    std::array<SBlock, kMostBlocks> m_ring{}; // blocks that may not have finished
    size_t m_first = 0;
    size_t m_count = 0;
};

} // namespace peru::media

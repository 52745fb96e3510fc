// How much of what was handed to the sound system has been heard.
#pragma once

#include "peru/media/Api.h"

#include <array>
#include <cstddef>
#include <cstdint>

namespace peru::media {

// The system takes sound in blocks and says of each when its first frame will be heard, on a clock of its own
// whose start means nothing. The frames heard by a moment are those of the blocks that have ended by then and
// the part of the running one that its time tells; a moment between two blocks, while there was nothing to
// play, adds nothing. So the count never falls, never passes what was handed over, and reaches that once
// the last block has been heard. Not locked; nothing allocates.
class PERU_MEDIA_API CPlayClock {
public:
    explicit CPlayClock(double framesPerSecond = 1.0) : m_framesPerSecond(framesPerSecond) {}

    // The next block; it is heard from `time` on.
    void add(double time, int64_t frames);
    // Frames heard by `now`. A time before the latest one that was told counts as that.
    double getHeard(double now);
    // The same without a look at the clock.
    double getHeard() { return getHeard(m_now); }
    // The system threw away what it had not played by `now`. Its next times may come from another clock.
    void drop(double now);

private:
    struct SBlock {
        double time;
        int64_t frames;
    };
    double getPart(const SBlock& block) const;
    void retireFirst();
    bool extendLast(double time, int64_t frames);

    // The system may take seconds ahead in buffers of a millisecond: what follows without a pause is kept
    // together. In seconds; the second one is how far a time may be off for that.
    static constexpr double kLongestBlock = 0.05;
    static constexpr double kTremble = 0.01;
    // Six seconds, more than any system takes ahead; past that the oldest block counts as heard.
    static constexpr size_t kMostBlocks = 128;

    double m_framesPerSecond;
    double m_now = -1e300;
    double m_heard = 0.0;                     // frames of blocks that have left the ring
    std::array<SBlock, kMostBlocks> m_ring{}; // blocks that may not have ended yet
    size_t m_first = 0;
    size_t m_count = 0;
};

} // namespace peru::media

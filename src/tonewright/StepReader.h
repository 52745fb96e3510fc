// Reads the samples that a waveform shows.
#pragma once

#include "sonora2/context/ISonoraContext.h"
#include "sonora2/media/IAudioSource.h"
#include "sonora2/media/ITwinSource.h"

#include <functional>
#include <vector>

namespace tonewright {

using peru::P;

// Reads the first frame of each step of a source of 16 bits, in blocks of 100 steps; an incomplete last block
// is dropped. Where the source has twins, processors that are idle read parts of it; the blocks and a failure
// are the same.
class CStepReader {
public:
    struct SBlock {
        double time;          // of the last step, in seconds from where the reading began
        const float* samples; // interleaved, full scale is 1.0
        int32_t count;        // of samples
    };
    // Receives the blocks in order, on the thread that reads. False ends the reading.
    using Receiver = std::function<bool(const SBlock& block)>;

    // The source is open.
    CStepReader(const P<sonora2::common::ISonoraContext>& context,
                const P<sonora2::common::IAudioSource>& source, int framesPerStep, Receiver receiver);

    // True at the end of the source, false if the receiver ended it. Throws what the source throws.
    bool read();

private:
    class CPartReader;
    struct SPart {
        std::vector<float> samples;
        bool isRead = false; // otherwise there was a failure, or something to warn of
    };

    // Both continue behind the blocks that have been delivered.
    bool readParts(sonora2::common::ITwinSource& source);
    bool readRest();
    std::vector<CPartReader> makeReaders(sonora2::common::ITwinSource& source, int count);
    bool deliver(const float* samples);

    const P<sonora2::common::ISonoraContext> m_context;
    const P<sonora2::common::IAudioSource> m_source;
    const int m_channels;
    const int64_t m_framesPerStep;
    const int m_rate;
    const Receiver m_receiver;
    int64_t m_delivered = 0; // blocks
};

} // namespace tonewright

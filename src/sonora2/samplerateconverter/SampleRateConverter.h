// Changes rate, channel layout and sample width of a stream of PCM.
#pragma once

#include "sonora2/media/IAudioChunk.h"

#include <memory>

namespace sonora2::samplerateconverter {

using peru::P;

// Made for one stream; there is no reset: a skip in the stream means a new converter. Equal rates are
// filtered too: the caller decides whether a converter is needed at all. One thread at a time.
class SONORA2_API CSampleRateConverter : public peru::CObject {
public:
    // Mixes the channels of a frame into planes; see ChannelConverters.h.
    class CChannelConverter;

    // Frames that one call gives at most. Where the input would give more, the rest of it waits for the
    // next call: nothing is lost.
    static constexpr int kMaxOutputFrames = 96000;

    // Bytes per sample: 1 to 4 in, 1 or 2 out. Without a memory manager the converter makes its own.
    // With planarOutput the chunks hold plane after plane in place of interleaved frames.
    CSampleRateConverter(int srcRate, int srcChannels, int srcBytes, int dstRate, int dstChannels,
                         int dstBytes, const P<peru::IMemoryManager>& memoryManager = nullptr,
                         bool planarOutput = false);
    ~CSampleRateConverter() override;

    // Whether there is a channel matrix for the two layouts.
    static bool canConvert(int srcChannels, int dstChannels);

    void setStartTime(double startTime); // added to the timestamps
    uint32_t getOutputPosition() const;  // frames handed out so far

    // Null data or size 0 flushes: one second of silence is pushed through the filter. A chunk of fewer
    // frames than the filter needs gives a chunk of size 0, and its samples wait. Bytes behind the last whole
    // frame are dropped. Throws peru::CError, after which the converter is not to be used further.
    P<audio::IAudioChunk> convert(const void* data, int size);

private:
    struct SImpl;
    std::unique_ptr<SImpl> m_impl;
};

} // namespace sonora2::samplerateconverter

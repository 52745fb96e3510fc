// Changes rate, channel layout and sample width of a stream of PCM.
#pragma once

#include "sonora2/media/IAudioChunk.h"

#include <memory>

namespace sonora2::samplerateconverter {

using peru::P;

// For one stream. There is no reset: after a skip, create a new converter. Equal rates are filtered too: the
// caller decides whether a converter is needed at all. One thread at a time.
class SONORA2_API CSampleRateConverter : public peru::CObject {
public:
    // Mixes the channels of a frame into planes; see ChannelConverters.h.
    class CChannelConverter;

    // Most frames returned by one call. The rest of a larger input is kept for the next call: nothing is
    // lost.
    static constexpr int kMaxOutputFrames = 96000;

    // Bytes per sample: 1 to 4, in and out. Output of 1 and 2 bytes is computed with 16 bits, wider output
    // with
    // 32. Without a memory manager the converter creates its own. With planarOutput the chunks hold plane
    // after plane instead of interleaved frames.
    CSampleRateConverter(int srcRate, int srcChannels, int srcBytes, int dstRate, int dstChannels,
                         int dstBytes, const P<peru::IMemoryManager>& memoryManager = nullptr,
                         bool planarOutput = false);
    ~CSampleRateConverter() override;

    // Whether there is a channel matrix for the two layouts.
    static bool canConvert(int srcChannels, int dstChannels);

    void setStartTime(double startTime); // added to the timestamps
    uint32_t getOutputPosition() const;  // frames returned so far

    // Null data or size 0 flushes: one second of silence is pushed through the filter. Input shorter than the
    // filter needs returns a chunk of size 0 and is kept. Bytes after the last complete frame are dropped.
    // Throws peru::CError, after which the converter must not be used any more.
    P<audio::IAudioChunk> convert(const void* data, int size);

private:
    struct SImpl;
    std::unique_ptr<SImpl> m_impl;
};

} // namespace sonora2::samplerateconverter

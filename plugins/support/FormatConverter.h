// Converts between the format of a file and the one that is delivered.
#pragma once

#include "sonora2/samplerateconverter/SampleRateConverter.h"
#include "support/MediaFile.h"

#include <vector>

namespace sonora2::plugins {

// For one run of sound; after a seek, create a new one.
//
// If only the width differs, samples are rounded or extended, without a filter. Where the number of channels
// stays the same and is above 3, every channel is resampled on its own: there are no channel matrices for
// most of these layouts, and the one for 6 channels replaces the last three by the centre.
class CFormatConverter {
public:
    CFormatConverter(const SPcmFormat& from, const SPcmFormat& to, const P<peru::IMemoryManager>& memory);
    ~CFormatConverter();

    static bool canConvert(int fromChannels, int toChannels);

    // 0 frames flush the filter. The result may be empty.
    P<peru::IMemoryBlock> convert(const uint8_t* pcm, int frames);

private:
    using CConverter = samplerateconverter::CSampleRateConverter;

    P<peru::IMemoryBlock> changeWidth(const uint8_t* pcm, int frames);
    P<peru::IMemoryBlock> convertSeparately(const uint8_t* pcm, int frames);

    const SPcmFormat m_from;
    const SPcmFormat m_to;
    const P<peru::IMemoryManager> m_memory;
    std::vector<P<CConverter>> m_converters; // none if only the width differs; one, or one for each channel
    std::vector<uint8_t> m_channel;          // samples of a single channel
    std::vector<int32_t> m_samples;
};

} // namespace sonora2::plugins

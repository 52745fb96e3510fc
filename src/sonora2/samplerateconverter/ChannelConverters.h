// The channel matrices of the sample rate converter.
#pragma once

#include "peru/Object.h"
#include "sonora2/samplerateconverter/SampleRateConverter.h"

#include <array>

namespace sonora2::samplerateconverter {

// Channel order is front left, front right, centre, then the rest. Stateless.
class SONORA2_API CSampleRateConverter::CChannelConverter : public peru::CObject {
public:
    static constexpr int kMaxChannels = 6;
    using SourcePointers = std::array<const int16_t*, kMaxChannels>; // the first sample of each channel
    using PlanePointers = std::array<int16_t*, kMaxChannels>;
    using WidePlanePointers = std::array<int32_t*, kMaxChannels>;

    // Reads `frames` frames from source pointers that advance by the stride, and writes each plane densely.
    // Planes for which isPlaneWritten() is false are left unchanged.
    virtual void convert(int frames, SourcePointers source, int sourceStrideBytes,
                         PlanePointers planes) const = 0;
    // The same for dense frames of 32-bit samples.
    virtual void convertWide(int frames, const int32_t* source, WidePlanePointers planes) const = 0;

    int getSourceChannels() const { return m_sourceChannels; }
    int getDestinationChannels() const { return m_destinationChannels; }
    bool isPlaneWritten(int plane) const { return (m_writtenPlanes >> plane & 1u) != 0; }

    // Empty if there is no matrix for the two layouts.
    static P<CChannelConverter> create(int sourceChannels, int destinationChannels);
    static bool exists(int sourceChannels, int destinationChannels);

protected:
    CChannelConverter(int sourceChannels, int destinationChannels, unsigned writtenPlanes)
        : m_sourceChannels(sourceChannels), m_destinationChannels(destinationChannels),
          m_writtenPlanes(writtenPlanes) {}

private:
    int m_sourceChannels;
    int m_destinationChannels;
    unsigned m_writtenPlanes; // one bit per plane
};

} // namespace sonora2::samplerateconverter

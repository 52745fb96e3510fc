// A timestamp and a counted block of samples.
#pragma once

#include "sonora2/media/IAudioChunk.h"

namespace sonora2::audio {

class SONORA2_API CAudioChunk : public peru::CObject, public IAudioChunk {
public:
    // Shares the block; copies nothing.
    CAudioChunk(double timestamp, P<peru::IMemoryBlock> block);
    ~CAudioChunk() override;

    double getTimestamp() const override { return m_timestamp; }
    uint8_t* getData() override { return m_block->getData(); }
    uint32_t getSize() const override { return static_cast<uint32_t>(m_block->getSize()); }
    P<peru::IMemoryBlock> getMemoryBlock() const override { return m_block; }

    // The timestamp as a double, then the serial form of the block.
    void writeTo(const P<peru::IDataOutStream>& stream) const override;
    void readFrom(const P<peru::IDataInStream>& stream) override;

private:
    double m_timestamp;
    P<peru::IMemoryBlock> m_block;
};

} // namespace sonora2::audio

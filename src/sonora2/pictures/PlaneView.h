// A part of a memory block that can be used like a block.
#pragma once

#include "peru/MemoryManager.h"
#include "sonora2/Api.h"

namespace sonora2::common {

using peru::P;

// Shares the bytes and holds the block, which must not shrink meanwhile. Cannot grow.
class CPlaneView : public peru::CObject, public peru::IMemoryBlock {
public:
    CPlaneView(const P<peru::IMemoryBlock>& block, int64_t offset, int64_t size);
    ~CPlaneView() override;

    uint8_t* getData() override { return m_block->getData() + m_offset; }
    const uint8_t* getData() const override { return m_block->getData() + m_offset; }
    int64_t getSize() const override { return m_size; }
    int64_t getCapacity() const override { return m_capacity; }
    void setSize(int64_t size) override; // throws CInvalidArgError beyond the capacity
    void writeTo(const P<peru::IDataOutStream>& stream) const override;
    void readFrom(const P<peru::IDataInStream>& stream) override;

private:
    const P<peru::IMemoryBlock> m_block;
    const int64_t m_offset;
    const int64_t m_capacity;
    int64_t m_size;
};

} // namespace sonora2::common

// The pixels of a decoded picture, which stay in the decoder's memory until somebody needs them in one piece.
#pragma once

#include "codecs/AvHandles.h"
#include "peru/MemoryManager.h"

#include <mutex>
#include <vector>

namespace sonora2::plugins::av {

using peru::P;

// The first access to the bytes copies them into a block of the memory manager. A picture that only crosses a
// pipe is written from the decoder's planes instead, which saves this copy. Any thread may be the first to
// access the bytes; otherwise as other blocks.
class CFrameBlock : public peru::CObject, public peru::IMemoryBlock {
public:
    // The rows of a plane of the frame follow each other without gaps.
    struct SPlane {
        int index; // in the frame
        int rowBytes;
        int rows;
    };

    // `planes` in their order in the block.
    CFrameBlock(const P<peru::IMemoryManager>& memory, Frame frame, std::vector<SPlane> planes);
    ~CFrameBlock() override;

    uint8_t* getData() override { return getCopy().getData(); }
    const uint8_t* getData() const override { return getCopy().getData(); }
    int64_t getSize() const override;
    int64_t getCapacity() const override { return getCopy().getCapacity(); }
    void setSize(int64_t size) override { getCopy().setSize(size); }
    void writeTo(const P<peru::IDataOutStream>& stream) const override;
    void readFrom(const P<peru::IDataInStream>& stream) override { getCopy().readFrom(stream); }

private:
    template <class Write> void forEachRun(Write write) const;
    peru::IMemoryBlock& getCopy() const;

    const P<peru::IMemoryManager> m_memory;
    const std::vector<SPlane> m_planes;
    mutable std::mutex m_mutex; // guards the members below
    mutable Frame m_frame;      // until it has been copied
    mutable P<peru::IMemoryBlock> m_copy;
};

} // namespace sonora2::plugins::av

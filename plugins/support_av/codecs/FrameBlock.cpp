#include "codecs/FrameBlock.h"

#include <cstring>
#include <utility>

namespace sonora2::plugins::av {

CFrameBlock::CFrameBlock(const P<peru::IMemoryManager>& memory, Frame frame, std::vector<SPlane> planes)
    : m_memory(memory), m_planes(std::move(planes)), m_frame(std::move(frame)) {}

CFrameBlock::~CFrameBlock() = default;

// Passes on what lies in one piece in the frame: whole planes, or rows if the decoder pads them.
template <class Write> void CFrameBlock::forEachRun(Write write) const {
    for (const SPlane& plane : m_planes) {
        const uint8_t* row = m_frame->data[plane.index];
        const ptrdiff_t pitch = m_frame->linesize[plane.index];
        if (pitch == plane.rowBytes) {
            write(row, int64_t{plane.rowBytes} * plane.rows);
            continue;
        }
        for (int i = 0; i < plane.rows; ++i) write(row + i * pitch, int64_t{plane.rowBytes});
    }
}

int64_t CFrameBlock::getSize() const {
    const std::lock_guard lock(m_mutex);
    if (m_copy) return m_copy->getSize();
    int64_t size = 0;
    for (const SPlane& plane : m_planes) size += int64_t{plane.rowBytes} * plane.rows;
    return size;
}

peru::IMemoryBlock& CFrameBlock::getCopy() const {
    const int64_t size = getSize();
    const std::lock_guard lock(m_mutex);
    if (m_copy) return *m_copy;
    P<peru::IMemoryBlock> copy = m_memory->getBlock(size);
    uint8_t* to = copy->getData();
    forEachRun([&to](const uint8_t* bytes, int64_t count) {
        std::memcpy(to, bytes, static_cast<size_t>(count));
        to += count;
    });
    m_copy = std::move(copy);
    m_frame.reset();
    return *m_copy;
}

void CFrameBlock::writeTo(const P<peru::IDataOutStream>& stream) const {
    const int64_t size = getSize();
    const std::lock_guard lock(m_mutex);
    if (m_copy) {
        m_copy->writeTo(stream);
        return;
    }
    stream->writeInt32(static_cast<int32_t>(size));
    forEachRun([&stream](const uint8_t* bytes, int64_t count) { stream->write(bytes, count); });
}

} // namespace sonora2::plugins::av

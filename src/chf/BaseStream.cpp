#include "chf/BaseStream.h"

#include <algorithm>
#include <stdexcept>

namespace chf {

void CBaseStream::Release() {
    if (--m_references == 0) delete this;
}

char* CBaseStream::getMoveBuffer() {
    if (!m_moveBuffer) m_moveBuffer = std::make_unique<char[]>(kMoveSize);
    return m_moveBuffer.get();
}

int64_t CBaseStream::moveBlock(int64_t source, int64_t destination, int64_t end) {
    const auto count = static_cast<uint32_t>(std::min(kMoveSize, end - source));
    Seek(source);
    if (Read(getMoveBuffer(), count) != count) throw std::runtime_error("unexpected end of the chunk file");
    Seek(destination);
    Write(getMoveBuffer(), count);
    return count;
}

void CBaseStream::InsertSpace(int64_t count) {
    if (count <= 0) return;
    const int64_t position = GetPosition();
    const int64_t end = GetSize();
    int64_t source = std::max(end - kMoveSize, position);
    int64_t destination = source + count;
    if (destination > end) Grow(destination);
    while (source < end) {
        const int64_t moved = moveBlock(source, destination, end);
        source += moved;
        destination += moved;
    }
    Seek(position);
}

void CBaseStream::RemoveSpace(int64_t count) {
    if (count <= 0) return;
    const int64_t position = GetPosition();
    const int64_t end = GetSize();
    int64_t source = position + count;
    int64_t destination = position;
    while (source < end) {
        const int64_t moved = moveBlock(source, destination, end);
        source += moved;
        destination += moved;
    }
    Truncate(end - count);
    Seek(position);
}

void CBaseStream::Grow(int64_t size) {
    const int64_t position = GetPosition();
    const int64_t end = GetSize();
    Seek(end);
    if (size > end) Write(getMoveBuffer(), static_cast<uint32_t>(std::min(kMoveSize, size - end)));
    Seek(position);
}

} // namespace chf

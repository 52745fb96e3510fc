#include "chf/ChunkIterator.h"

#include <algorithm>
#include <cstring>
#include <stdexcept>

namespace chf {

void CChunkIterator::invalidate() {
    m_valid = false;
    m_id = 0;
    m_bodySize = 0;
}

void CChunkIterator::Rewind() {
    Seek(0);
    m_offset = 0;
    invalidate();
}

bool CChunkIterator::Next() {
    const int64_t end = std::max<int64_t>(m_size, 0);
    int64_t position = m_offset;
    // A body that claims more than there is ends the sequence, also where the sum would overflow.
    if (m_valid)
        position = m_bodySize > end - m_offset - kHeaderSize ? end : m_offset + m_bodySize + kHeaderSize;
    Seek(position);
    m_offset = position;
    invalidate();
    if (position > end - kHeaderSize) return false;

    char header[kHeaderSize];
    if (Read(header, kHeaderSize) != kHeaderSize) return false;
    int64_t size = 0;
    std::memcpy(&size, header + sizeof m_id, sizeof size);
    // The size in the file is out of date until the stream that has changed it is closed. That stream may
    // have been opened through another iterator.
    if (const int64_t live = getRoot()->findLiveSize(m_base + position + kHeaderSize); live >= 0) size = live;
    if (size < 0) return false;
    std::memcpy(&m_id, header, sizeof m_id);
    m_bodySize = size;
    m_valid = true;
    return true;
}

int64_t CChunkIterator::findLiveSize(int64_t base) const {
    int64_t size = CChunkStream::findLiveSize(base);
    for (const CChunkStream* child = m_firstChild; child && size < 0; child = child->m_next)
        size = child->findLiveSize(base);
    return size;
}

const CChunkIterator* CChunkIterator::getRoot() const {
    const auto* parent = dynamic_cast<const CChunkIterator*>(m_holder.get());
    return parent ? parent->getRoot() : this;
}

template <class T> TRef<T> CChunkIterator::openChild() {
    if (!m_valid) throw std::logic_error("there is no current chunk");
    TRef<T> child(new T(this, m_underlying.get(), m_base + m_offset + kHeaderSize, m_bodySize));
    CChunkStream* link = child.get();
    link->m_next = m_firstChild;
    if (m_firstChild) m_firstChild->m_previous = link;
    m_firstChild = link;
    return child;
}

TRef<CChunkStream> CChunkIterator::OpenStream() {
    return openChild<CChunkStream>();
}

TRef<CChunkIterator> CChunkIterator::OpenIterator() {
    return openChild<CChunkIterator>();
}

void CChunkIterator::ChildClosed(CChunkStream* child) {
    if (child->m_previous) child->m_previous->m_next = child->m_next;
    if (child->m_next) child->m_next->m_previous = child->m_previous;
    if (m_firstChild == child) m_firstChild = child->m_next;
}

void CChunkIterator::OnSpaceInserted(IChunkSpaceListener* origin, int64_t position, int64_t count) {
    // Space in front of the body moves the base, and the current chunk, whose offset is relative, with it.
    if (position >= m_base) adjustCurrentToInsertion(position - m_base, count);
    adjustToInsertion(position, count);
    for (CChunkStream* child = m_firstChild; child; child = child->m_next)
        if (static_cast<IChunkSpaceListener*>(child) != origin)
            child->OnSpaceInserted(nullptr, position, count);
    if (origin && m_holder) m_holder->OnSpaceInserted(this, position, count);
}

void CChunkIterator::OnSpaceRemoved(IChunkSpaceListener* origin, int64_t position, int64_t count) {
    if (position >= m_base) adjustCurrentToRemoval(position - m_base, count);
    adjustToRemoval(position, count);
    for (CChunkStream* child = m_firstChild; child; child = child->m_next)
        if (static_cast<IChunkSpaceListener*>(child) != origin)
            child->OnSpaceRemoved(nullptr, position, count);
    if (origin && m_holder) m_holder->OnSpaceRemoved(this, position, count);
}

// Positions are relative to the base from here on. A position inside the current header changes nothing.
void CChunkIterator::adjustCurrentToInsertion(int64_t position, int64_t count) {
    if (position <= m_offset) {
        m_offset += count;
    } else if (m_valid) {
        const int64_t inBody = position - m_offset - kHeaderSize;
        if (inBody >= 0 && inBody <= m_bodySize) grow(m_bodySize, count);
    }
}

void CChunkIterator::adjustCurrentToRemoval(int64_t position, int64_t count) {
    if (position <= m_offset) {
        // The current chunk is gone if its start is; the next one then takes its place.
        if (position + count > m_offset) invalidate();
        m_offset = std::max(position, m_offset - count);
    } else if (m_valid) {
        const int64_t inBody = position - m_offset - kHeaderSize;
        if (inBody >= 0 && inBody < m_bodySize) m_bodySize -= std::min(count, m_bodySize - inBody);
    }
}

} // namespace chf

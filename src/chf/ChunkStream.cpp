#include "chf/ChunkStream.h"

#include <algorithm>
#include <exception>
#include <limits>

namespace chf {

CChunkStream::CChunkStream(IChunkHolder* holder, IStream* underlying, int64_t base, int64_t size)
    : m_holder(TRef<IChunkHolder>::Share(holder)), m_underlying(TRef<IStream>::Share(underlying)),
      m_base(base), m_size(size) {}

CChunkStream::~CChunkStream() {
    try {
        StoreSize();
    } catch (const std::exception&) {
        // Callers that need to know call StoreSize themselves.
    }
    if (m_holder) m_holder->ChildClosed(this);
}

void CChunkStream::Release() {
    if (--m_references == 0) delete this;
}

void CChunkStream::StoreSize() {
    if (!m_sizeChanged || m_deleted) return;
    m_underlying->Seek(m_base - kSizeFieldSize);
    m_underlying->Write(&m_size, kSizeFieldSize);
    m_sizeChanged = false;
}

void CChunkStream::Write(const void* buffer, uint32_t count) {
    const int64_t extra = m_position - m_size + count;
    if (extra > 0) {
        const int64_t end = m_base + m_size;
        m_underlying->Seek(end);
        m_underlying->InsertSpace(extra);
        if (m_holder) m_holder->OnSpaceInserted(this, end, extra);
        resize(extra);
    }
    m_underlying->Seek(m_base + m_position);
    m_underlying->Write(buffer, count);
    m_position += count;
}

uint32_t CChunkStream::Read(void* buffer, uint32_t count) {
    m_underlying->Seek(m_base + m_position);
    const uint32_t read = m_underlying->Read(buffer, count);
    m_position = std::min(m_position + count, m_size);
    return read;
}

void CChunkStream::InsertSpace(int64_t count) {
    if (count <= 0) return;
    const int64_t position = m_base + m_position;
    m_underlying->Seek(position);
    m_underlying->InsertSpace(count);
    OnSpaceInserted(this, position, count);
}

void CChunkStream::RemoveSpace(int64_t count) {
    if (count <= 0) return;
    const int64_t position = m_base + m_position;
    m_underlying->Seek(position);
    m_underlying->RemoveSpace(count);
    OnSpaceRemoved(this, position, count);
}

void CChunkStream::OnSpaceInserted(IChunkSpaceListener* origin, int64_t position, int64_t count) {
    adjustToInsertion(position, count);
    if (origin && m_holder) m_holder->OnSpaceInserted(this, position, count);
}

void CChunkStream::OnSpaceRemoved(IChunkSpaceListener* origin, int64_t position, int64_t count) {
    adjustToRemoval(position, count);
    if (origin && m_holder) m_holder->OnSpaceRemoved(this, position, count);
}

int64_t CChunkStream::findLiveSize(int64_t base) const {
    return base == m_base && !m_deleted ? m_size : -1;
}

void CChunkStream::resize(int64_t difference) {
    grow(m_size, difference);
    m_sizeChanged = true;
}

void CChunkStream::grow(int64_t& size, int64_t count) {
    if (__builtin_add_overflow(size, count, &size)) size = std::numeric_limits<int64_t>::max();
}

void CChunkStream::adjustToInsertion(int64_t position, int64_t count) {
    if (position < m_base)
        m_base += count;
    else if (position - m_base <= m_size)
        resize(count);
}

void CChunkStream::adjustToRemoval(int64_t position, int64_t count) {
    if (position >= m_base) {
        // Nothing of the body is removed when the range starts at its end: that is the next chunk's header.
        if (position - m_base < m_size) resize(-std::min(count, m_size - (position - m_base)));
    } else if (m_base - position + m_size <= count) {
        m_deleted = true;
    } else {
        m_base -= count;
    }
}

} // namespace chf

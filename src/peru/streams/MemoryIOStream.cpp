#include "peru/streams/MemoryIOStream.h"

#include "peru/Errors.h"
#include "peru/uri/IURI.h"

#include <algorithm>
#include <cstring>
#include <limits>
#include <new>

namespace peru {

CMemoryIOStream::CMemoryIOStream(const P<IMemoryBlock>& block, const P<IURI>& uri)
    : m_block(block ? block : P<IMemoryBlock>(make<CMemoryBlock>())), m_uri(uri) {}

CMemoryIOStream::~CMemoryIOStream() = default;

void CMemoryIOStream::checkOpen() const {
    if (m_closed) throw CStreamClosedError(m_uri);
}

void CMemoryIOStream::close() {
    m_closed = true;
}

P<IURI> CMemoryIOStream::getURI() const {
    return m_uri;
}

bool CMemoryIOStream::isAtEnd() {
    checkOpen();
    return m_position >= m_block->getSize();
}

void CMemoryIOStream::read(void* buffer, int64_t size) {
    readFully(*this, buffer, size);
}

int64_t CMemoryIOStream::readSome(void* buffer, int64_t size) {
    checkOpen();
    checkStreamSize(size, "CMemoryIOStream::readSome");
    const int64_t count = std::clamp<int64_t>(m_block->getSize() - m_position, 0, size);
    if (count > 0) std::memcpy(buffer, m_block->getData() + m_position, static_cast<size_t>(count));
    m_position += count;
    return count;
}

void CMemoryIOStream::skip(int64_t size) {
    checkOpen();
    checkStreamSize(size, "CMemoryIOStream::skip");
    if (size > m_block->getSize() - m_position) throw CEndOfStreamError(m_uri);
    m_position += size;
}

void CMemoryIOStream::write(const void* buffer, int64_t size) {
    checkOpen();
    checkStreamSize(size, "CMemoryIOStream::write");
    if (size == 0) return;
    if (size > std::numeric_limits<int64_t>::max() - m_position) throw std::bad_alloc();
    if (m_position + size > m_block->getSize()) setSize(m_position + size);
    std::memcpy(m_block->getData() + m_position, buffer, static_cast<size_t>(size));
    m_position += size;
}

void CMemoryIOStream::flush() {
    checkOpen();
}

void CMemoryIOStream::reset() {
    seek(0);
}

int64_t CMemoryIOStream::getPosition() const {
    checkOpen();
    return m_position;
}

void CMemoryIOStream::seek(int64_t position) {
    checkOpen();
    if (position < 0) throw CInvalidArgError("position", "CMemoryIOStream::seek");
    m_position = position;
}

int64_t CMemoryIOStream::getSize() const {
    checkOpen();
    return m_block->getSize();
}

void CMemoryIOStream::setSize(int64_t size) {
    checkOpen();
    checkStreamSize(size, "CMemoryIOStream::setSize");
    const int64_t before = m_block->getSize();
    // Doubled here so that the growth does not depend on the kind of block.
    const int64_t capacity = m_block->getCapacity();
    if (size > capacity && size <= std::numeric_limits<int64_t>::max() / 2)
        m_block->setSize(std::max(size, capacity * 2));
    m_block->setSize(size);
    if (size > before) std::memset(m_block->getData() + before, 0, static_cast<size_t>(size - before));
}

P<IStreamMarker> CMemoryIOStream::createMarker() {
    return make<CMarker>(P<ISeekableStream>::share(this));
}

} // namespace peru

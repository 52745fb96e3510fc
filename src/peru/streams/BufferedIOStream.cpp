#include "peru/streams/BufferedIOStream.h"

#include "peru/Errors.h"
#include "peru/streams/StreamTools.h"
#include "peru/uri/IURI.h"

#include <algorithm>
#include <cstring>

namespace peru {

CBufferedIOStream::CBufferedIOStream(const P<IMemoryManager>& memoryManager)
    : m_memoryManager(memoryManager ? memoryManager : P<IMemoryManager>(make<CMemoryManager>())) {}

CBufferedIOStream::~CBufferedIOStream() = default;

void CBufferedIOStream::checkOpen() const {
    if (m_closed) throw CStreamClosedError();
}

void CBufferedIOStream::close() {
    clear();
    m_closed = true;
}

P<IURI> CBufferedIOStream::getURI() const {
    return nullptr;
}

bool CBufferedIOStream::isAtEnd() {
    checkOpen();
    return m_available == 0;
}

void CBufferedIOStream::takeOut(uint8_t* target, int64_t size) {
    while (size > 0) {
        IMemoryBlock& block = *m_blocks.front();
        const int64_t count = std::min(size, block.getSize() - m_readOffset);
        if (target) {
            std::memcpy(target, block.getData() + m_readOffset, static_cast<size_t>(count));
            target += count;
        }
        m_readOffset += count;
        m_available -= count;
        size -= count;
        if (m_readOffset == block.getSize()) {
            m_blocks.pop_front();
            m_readOffset = 0;
        }
    }
}

void CBufferedIOStream::read(void* buffer, int64_t size) {
    checkOpen();
    checkStreamSize(size, "CBufferedIOStream::read");
    if (size > m_available) throw CEndOfStreamError();
    takeOut(static_cast<uint8_t*>(buffer), size);
}

int64_t CBufferedIOStream::readSome(void* buffer, int64_t size) {
    checkOpen();
    checkStreamSize(size, "CBufferedIOStream::readSome");
    size = std::min(size, m_available);
    takeOut(static_cast<uint8_t*>(buffer), size);
    return size;
}

void CBufferedIOStream::skip(int64_t size) {
    checkOpen();
    checkStreamSize(size, "CBufferedIOStream::skip");
    if (size > m_available) throw CEndOfStreamError();
    takeOut(nullptr, size);
}

void CBufferedIOStream::write(const void* buffer, int64_t size) {
    checkOpen();
    checkStreamSize(size, "CBufferedIOStream::write");
    if (size == 0) return;
    const P<IMemoryBlock> block = m_memoryManager->getBlock(size);
    std::memcpy(block->getData(), buffer, static_cast<size_t>(size));
    append(block);
}

void CBufferedIOStream::flush() {
    checkOpen();
}

void CBufferedIOStream::append(const P<IMemoryBlock>& block) {
    checkOpen();
    const int64_t size = block->getSize();
    if (size == 0) return;
    m_blocks.push_back(block);
    m_available += size;
    m_totalWritten += size;
}

void CBufferedIOStream::clear() {
    m_blocks.clear();
    m_readOffset = 0;
    m_available = 0;
}

} // namespace peru

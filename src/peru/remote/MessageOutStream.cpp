#include "peru/remote/MessageOutStream.h"

#include "peru/streams/StreamTools.h"

namespace peru {

namespace {

constexpr int64_t kSmallBuffer = 0x4000;
constexpr int64_t kLargeWrite = 0x2000; // copying less than this is cheaper than a system call

} // namespace

CMessageOutStream::CMessageOutStream(const P<IOutStream>& target)
    : m_target(target), m_pipe(tryCast<IPipeOutStream>(target)), m_block(make<CMemoryBlock>(kSmallBuffer)) {}

CMessageOutStream::~CMessageOutStream() = default;

void CMessageOutStream::setBuffer(const P<IMemoryBlock>& block) {
    if (m_held > 0) send(nullptr, 0);
    m_block = block;
}

bool CMessageOutStream::discard() {
    m_held = 0;
    return !std::exchange(m_hasSent, false);
}

void CMessageOutStream::write(const void* buffer, int64_t size) {
    checkStreamSize(size, "write");
    if (size >= kLargeWrite) {
        send(buffer, size);
        return;
    }
    if (size > m_block->getSize() - m_held) send(nullptr, 0);
    std::memcpy(m_block->getData() + m_held, buffer, static_cast<size_t>(size));
    m_held += size;
}

void CMessageOutStream::flush() {
    if (m_held > 0) send(nullptr, 0);
    m_hasSent = false;
    m_target->flush();
}

// Sends what is held back and `more`.
void CMessageOutStream::send(const void* more, int64_t size) {
    m_hasSent = true;
    const SPipePart parts[] = {{m_block->getData(), std::exchange(m_held, 0)}, {more, size}};
    if (m_pipe) {
        m_pipe->writeParts(parts, std::size(parts));
        return;
    }
    for (const SPipePart& part : parts)
        if (part.size > 0) m_target->write(part.data, part.size);
}

} // namespace peru

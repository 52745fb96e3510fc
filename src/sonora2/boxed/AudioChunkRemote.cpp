#include "sonora2/boxed/AudioChunkRemote.h"

#include "sonora2/media/AudioChunk.h"

#include <algorithm>

namespace sonora2::audio {

namespace {

// What is allocated on the word of the peer.
constexpr int64_t kTrustedSize = 1 << 20;

} // namespace

CAudioChunkRemote::CAudioChunkRemote(const P<peru::IMemoryManager>& memoryManager,
                                     const P<IAudioChunk>& chunk)
    : m_memoryManager(memoryManager), m_chunk(chunk) {}

CAudioChunkRemote::~CAudioChunkRemote() = default;

void CAudioChunkRemote::writeTo(const P<peru::IDataOutStream>& stream) const {
    stream->writeBool(static_cast<bool>(m_chunk));
    if (!m_chunk) return;
    stream->writeDouble(m_chunk->getTimestamp());
    stream->writeUInt32(m_chunk->getSize());
    if (m_chunk->getSize() > 0) stream->write(m_chunk->getData(), m_chunk->getSize());
}

void CAudioChunkRemote::readFrom(const P<peru::IDataInStream>& stream) {
    m_chunk = nullptr;
    if (!stream->readBool()) return;
    const double timestamp = stream->readDouble();
    const int64_t size = stream->readUInt32();
    P<peru::IMemoryBlock> block = m_memoryManager->getBlock(std::min(size, kTrustedSize));
    for (int64_t done = 0; done < size;) {
        const int64_t step = std::min(size - done, std::max(done, kTrustedSize));
        block->setSize(done + step);
        stream->read(block->getData() + done, step);
        done += step;
    }
    m_chunk = peru::make<CAudioChunk>(timestamp, std::move(block));
}

} // namespace sonora2::audio

#include "sonora2/media/AudioChunk.h"

namespace sonora2::audio {

CAudioChunk::CAudioChunk(double timestamp, P<peru::IMemoryBlock> block)
    : m_timestamp(timestamp), m_block(std::move(block)) {
    // A chunk created for readFrom() has no block yet.
    if (!m_block) m_block = peru::make<peru::CMemoryBlock>();
}

CAudioChunk::~CAudioChunk() = default;

void CAudioChunk::writeTo(const P<peru::IDataOutStream>& stream) const {
    stream->writeDouble(m_timestamp);
    m_block->writeTo(stream);
}

void CAudioChunk::readFrom(const P<peru::IDataInStream>& stream) {
    m_timestamp = stream->readDouble();
    m_block->readFrom(stream);
}

} // namespace sonora2::audio

// A chunk that crosses the pipe.
#pragma once

#include "peru/Object.h"
#include "sonora2/media/IAudioChunk.h"

namespace sonora2::audio {

// Holds a chunk or none. Reading creates one from this side's memory manager.
class SONORA2_API CAudioChunkRemote : public peru::CObject, public IAudioChunk {
public:
    explicit CAudioChunkRemote(const P<peru::IMemoryManager>& memoryManager,
                               const P<IAudioChunk>& chunk = nullptr);
    ~CAudioChunkRemote() override;

    const P<IAudioChunk>& getChunk() const { return m_chunk; }

    // Forwarded to the chunk; 0 or empty if there is none.
    double getTimestamp() const override { return m_chunk ? m_chunk->getTimestamp() : 0.0; }
    uint8_t* getData() override { return m_chunk ? m_chunk->getData() : nullptr; }
    uint32_t getSize() const override { return m_chunk ? m_chunk->getSize() : 0; }
    P<peru::IMemoryBlock> getMemoryBlock() const override {
        return m_chunk ? m_chunk->getMemoryBlock() : nullptr;
    }

    // A bool, true if a chunk follows: its timestamp as a double, its size as uint32, its bytes. Memory is
    // allocated only as the bytes arrive.
    void writeTo(const P<peru::IDataOutStream>& stream) const override;
    void readFrom(const P<peru::IDataInStream>& stream) override;

private:
    P<peru::IMemoryManager> m_memoryManager;
    P<IAudioChunk> m_chunk;
};

} // namespace sonora2::audio

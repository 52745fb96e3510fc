#include "sonora2/boxed/AudioRun.h"

#include "peru/strings/String.h"
#include "sonora2/boxed/AudioChunkRemote.h"

namespace sonora2::audio {

CAudioRun::CAudioRun(const P<peru::IMemoryManager>& memoryManager) : m_memoryManager(memoryManager) {}

CAudioRun::~CAudioRun() = default;

void CAudioRun::writeTo(const P<peru::IDataOutStream>& stream) const {
    stream->writeInt32(static_cast<int32_t>(chunks.size()));
    for (const P<IAudioChunk>& chunk : chunks)
        peru::make<CAudioChunkRemote>(m_memoryManager, chunk)->writeTo(stream);
    stream->writeBool(isEOF);
    stream->writeDouble(duration);
    stream->writeString(failure);
    stream->writeString(log);
}

void CAudioRun::readFrom(const P<peru::IDataInStream>& stream) {
    chunks.clear();
    const P<CAudioChunkRemote> reader = peru::make<CAudioChunkRemote>(m_memoryManager);
    for (int32_t left = stream->readInt32(); left > 0; --left) {
        reader->readFrom(stream);
        chunks.push_back(reader->getChunk());
    }
    isEOF = stream->readBool();
    duration = stream->readDouble();
    failure = stream->readString();
    log = stream->readString();
}

} // namespace sonora2::audio

#include "sonora2/boxed/AudioRun.h"

#include "peru/remote/RemoteException.h"
#include "peru/strings/String.h"
#include "peru/strings/StringFormat.h"
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
    const int32_t count = stream->readInt32();
    if (count < 0 || static_cast<size_t>(count) > kMostChunks)
        throw peru::CRemoteException(peru::format("a run of %d chunks of sound is too long", count));
    for (int32_t left = count; left > 0; --left) {
        reader->readFrom(stream);
        chunks.push_back(reader->getChunk());
    }
    isEOF = stream->readBool();
    duration = stream->readDouble();
    failure = stream->readString();
    log = stream->readString();
}

} // namespace sonora2::audio

#include "sonora2/boxed/RemoteMediaState.h"

namespace sonora2::common {

void CRemoteMediaState::writeTo(const P<peru::IDataOutStream>& stream) const {
    stream->writeBool(isOpened);
    stream->writeBool(isEOF);
    stream->writeInt32(facets);
    stream->writeDouble(duration);
    stream->writeDouble(startTime);
    stream->writeInt32(sampleRate);
    stream->writeInt32(channelCount);
    stream->writeInt32(bytesPerSample);
    stream->writeUInt32(usedSettings);
    stream->writeString(failure);
    stream->writeString(log);
}

void CRemoteMediaState::readFrom(const P<peru::IDataInStream>& stream) {
    isOpened = stream->readBool();
    isEOF = stream->readBool();
    facets = stream->readInt32();
    duration = stream->readDouble();
    startTime = stream->readDouble();
    sampleRate = stream->readInt32();
    channelCount = stream->readInt32();
    bytesPerSample = stream->readInt32();
    usedSettings = stream->readUInt32();
    failure = stream->readString();
    log = stream->readString();
}

} // namespace sonora2::common

#include "sonora2/boxed/RemoteFacets.h"

namespace sonora2::common {

void CRemoteMediaDescription::writeTo(const P<peru::IDataOutStream>& stream) const {
    stream->writeString(codecName);
    stream->writeInt64(bitRate);
    stream->writeInt32(sampleRate);
    stream->writeInt32(channelCount);
    stream->writeInt32(bytesPerSample);
}

void CRemoteMediaDescription::readFrom(const P<peru::IDataInStream>& stream) {
    codecName = stream->readString();
    bitRate = stream->readInt64();
    sampleRate = stream->readInt32();
    channelCount = stream->readInt32();
    bytesPerSample = stream->readInt32();
}

} // namespace sonora2::common

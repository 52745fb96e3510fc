// Properties of the file behind a source, beyond the format that the source delivers.
#pragma once

#include "peru/strings/String.h"
#include "sonora2/Api.h"

namespace sonora2::common {

using peru::P;

// Optional; found by an interface cast on a source. Valid once the source has been open.
class SONORA2_API IMediaDescription : public virtual peru::IBase {
public:
    virtual P<peru::IString> getCodecName() = 0; // such as "FLAC" or "PCM signed 24 bit"; empty when unknown
    virtual int64_t getBitRate() = 0;            // bits per second on average, 0 when unknown
    // The file's own format, whatever the source delivers. Samples wider than 4 bytes count as 4.
    virtual int getOwnSampleRate() = 0;
    virtual int getOwnChannelCount() = 0;
    virtual int getOwnBytesPerSample() = 0;
    // Has the source deliver another format from its start time on; open or closed, without opening the file
    // again. Throws if the file cannot be converted to it.
    virtual void setDeliveredFormat(int sampleRate, int channelCount, int bytesPerSample) = 0;
    // What was noticed while reading since the last call, one warning per line, such as clipping or damage
    // that was replaced by silence. Some are known only when the source has been closed.
    virtual P<peru::IString> takeWarnings() = 0;
};

} // namespace sonora2::common

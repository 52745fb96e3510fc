// The audio streams of a container.
#pragma once

#include "peru/ISerializable.h"
#include "sonora2/Api.h"

namespace sonora2::audio {

using peru::P;

class SONORA2_API IAudioInfo : public virtual peru::IBase, public virtual peru::ISerializable {
public:
    virtual int getStreamIndex() const = 0;
    virtual P<peru::IString> getStreamName() const = 0;
    virtual P<peru::IString> getStreamLanguage() const = 0;
};

class SONORA2_API IAudioStreamInfos : public virtual peru::IBase, public virtual peru::ISerializable {
public:
    virtual int getStreamCount() const = 0;
    virtual P<IAudioInfo> getStreamInfo(int index) const = 0;
};

} // namespace sonora2::audio

// Describes the audio streams of a source's container.
#pragma once

#include "peru/Object.h"
#include "sonora2/media/IAudioStreamInfos.h"

#include <vector>

namespace sonora2::audio {

class SONORA2_API CAudioInfo : public peru::CObject, public IAudioInfo {
public:
    // Empty handles count as empty texts.
    explicit CAudioInfo(int index = 0, const P<peru::IString>& name = nullptr,
                        const P<peru::IString>& language = nullptr);
    ~CAudioInfo() override;

    int getStreamIndex() const override { return m_index; }
    P<peru::IString> getStreamName() const override { return m_name; }
    P<peru::IString> getStreamLanguage() const override { return m_language; }

    // Index as int32, name, language.
    void writeTo(const P<peru::IDataOutStream>& stream) const override;
    void readFrom(const P<peru::IDataInStream>& stream) override;

private:
    int m_index;
    P<peru::IString> m_name;
    P<peru::IString> m_language;
};

class SONORA2_API CAudioStreamInfos : public peru::CObject, public IAudioStreamInfos {
public:
    CAudioStreamInfos();
    ~CAudioStreamInfos() override;

    void add(const P<IAudioInfo>& info);
    int getStreamCount() const override { return static_cast<int>(m_infos.size()); }
    P<IAudioInfo> getStreamInfo(int index) const override; // throws CInvalidArgError outside the array

    // The count as int32, then the elements. Reading replaces the content; memory use is bounded by the bytes
    // in the stream, not by the count.
    void writeTo(const P<peru::IDataOutStream>& stream) const override;
    void readFrom(const P<peru::IDataInStream>& stream) override;

private:
    std::vector<P<IAudioInfo>> m_infos;
};

} // namespace sonora2::audio

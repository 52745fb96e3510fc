#include "sonora2/media/AudioStreamInfos.h"

#include "peru/Errors.h"
#include "peru/strings/StringFormat.h"

namespace sonora2::audio {

namespace {

constexpr int32_t kMostStreams = 65'536; // no container numbers more

P<peru::IString> orEmpty(const P<peru::IString>& text) {
    return text ? text : peru::CString::empty();
}

} // namespace

CAudioInfo::CAudioInfo(int index, const P<peru::IString>& name, const P<peru::IString>& language)
    : m_index(index), m_name(orEmpty(name)), m_language(orEmpty(language)) {}

CAudioInfo::~CAudioInfo() = default;

void CAudioInfo::writeTo(const P<peru::IDataOutStream>& stream) const {
    stream->writeInt32(m_index);
    stream->writeString(m_name);
    stream->writeString(m_language);
}

void CAudioInfo::readFrom(const P<peru::IDataInStream>& stream) {
    m_index = stream->readInt32();
    m_name = orEmpty(stream->readString());
    m_language = orEmpty(stream->readString());
}

CAudioStreamInfos::CAudioStreamInfos() = default;

CAudioStreamInfos::~CAudioStreamInfos() = default;

void CAudioStreamInfos::add(const P<IAudioInfo>& info) {
    m_infos.push_back(info);
}

P<IAudioInfo> CAudioStreamInfos::getStreamInfo(int index) const {
    if (index < 0 || index >= getStreamCount())
        throw peru::CInvalidArgError("index", "CAudioStreamInfos::getStreamInfo");
    return m_infos[static_cast<size_t>(index)];
}

void CAudioStreamInfos::writeTo(const P<peru::IDataOutStream>& stream) const {
    stream->writeInt32(getStreamCount());
    for (const P<IAudioInfo>& info : m_infos) info->writeTo(stream);
}

void CAudioStreamInfos::readFrom(const P<peru::IDataInStream>& stream) {
    m_infos.clear();
    // An entry takes much more memory than bytes in the stream.
    const int32_t count = stream->readInt32();
    if (count > kMostStreams)
        throw peru::CException(peru::format("a list of %d audio streams is not possible", count), nullptr);
    for (int32_t i = 0; i < count; ++i) {
        P<IAudioInfo> info = peru::make<CAudioInfo>();
        info->readFrom(stream);
        m_infos.push_back(std::move(info));
    }
}

} // namespace sonora2::audio

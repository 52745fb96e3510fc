#include "sonora2/plugins/PluginExtensions.h"

#include "peru/strings/LocalizedFormat.h"
#include "peru/uri/URI.h"
#include "sonora2/context/SonoraError.h"

#include <algorithm>

namespace sonora2::common {

using peru::CString;
using peru::IString;

namespace {

// What is read from another process. Every one is compared with all before it.
constexpr int32_t kMostExtensions = 10'000;

std::string toLowerAscii(std::string text) {
    for (char& c : text)
        if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
    return text;
}

} // namespace

CPluginExtensions::CPluginExtensions() = default;
CPluginExtensions::~CPluginExtensions() = default;

P<IString> CPluginExtensions::getExtension(int index) const {
    if (index < 0 || index >= getCount())
        throw peru::CInvalidArgError("index", "CPluginExtensions::getExtension");
    return m_extensions[static_cast<size_t>(index)];
}

bool CPluginExtensions::addExtension(const P<IString>& extension) {
    auto isEqual = [&extension](const P<IString>& held) { return held->equals(extension); };
    if (std::any_of(m_extensions.begin(), m_extensions.end(), isEqual)) return false;
    m_extensions.push_back(extension ? extension : peru::CString::empty());
    return true;
}

void CPluginExtensions::writeTo(const P<peru::IDataOutStream>& stream) const {
    stream->writeInt32(getCount());
    for (const P<IString>& extension : m_extensions) stream->writeString(extension);
}

void CPluginExtensions::readFrom(const P<peru::IDataInStream>& stream) {
    m_extensions.clear();
    const int32_t count = stream->readInt32();
    if (count < 0)
        throw CSonoraError(peru::localize("sonora2.CPluginExtensions.negative",
                                          "the list of file extensions has a negative count"));
    if (count > kMostExtensions)
        throw CSonoraError(
            peru::localize("sonora2.CPluginExtensions.tooMany", "the list of file extensions is too long"));
    for (int32_t i = 0; i < count; ++i) {
        P<IString> extension = stream->readString();
        // At its end the stream delivers empty texts.
        if (!extension || extension->isEmpty())
            throw CSonoraError(
                peru::localize("sonora2.CPluginExtensions.early", "the list of file extensions ends early"));
        addExtension(extension);
    }
}

P<IString> getLookupKey(const P<peru::IURI>& uri, const P<IString>& uriSuffix) {
    std::string name = toLowerAscii(CString::toStdString(peru::CURI::unescape(uri->getFileName())));
    const std::string suffix = toLowerAscii(CString::toStdString(uriSuffix));
    if (!suffix.empty() && name.ends_with(suffix)) name.resize(name.size() - suffix.size());
    name.erase(0, std::min(name.find_first_not_of('.'), name.size())); // the dot of a hidden file
    const size_t point = name.rfind('.');
    return point == std::string::npos ? CString::empty() : CString::fromUTF8(name.substr(point + 1));
}

} // namespace sonora2::common

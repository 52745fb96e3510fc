#include "peru/files/MimeType.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

namespace peru {

namespace {

P<IString> makeName(const CStringArg& text) {
    return CString::fromUTF8(CString::toStdString(text))->trim()->toLower();
}

} // namespace

CMimeType::CMimeType(const CStringArg& major, const CStringArg& minor)
    : m_major(makeName(major)), m_minor(makeName(minor)) {}

CMimeType::~CMimeType() = default;

P<CMimeType> CMimeType::parse(const CStringArg& text) {
    const std::string bytes = CString::toStdString(text);
    const std::string type = bytes.substr(0, bytes.find(';'));
    const size_t slash = type.find('/');
    if (slash != std::string::npos && type.find('/', slash + 1) == std::string::npos) {
        const P<CMimeType> result = make<CMimeType>(CString::fromUTF8(type.substr(0, slash)),
                                                    CString::fromUTF8(type.substr(slash + 1)));
        if (!result->m_major->isEmpty() && !result->m_minor->isEmpty()) return result;
    }
    throw CParseError(
        localize("peru.CMimeType.parseError", "'%TYPE%' is not a MIME type.", {{"%TYPE%", text}}));
}

P<IString> CMimeType::getAsString() const {
    return m_major + "/" + m_minor;
}

bool CMimeType::equals(const P<CMimeType>& other) const {
    return other && m_major->equals(other->m_major) && m_minor->equals(other->m_minor);
}

P<IString> CMimeType::getObjectDesc() const {
    return getAsString();
}

} // namespace peru

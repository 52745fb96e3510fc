// MIME types.
#pragma once

#include "peru/Object.h"
#include "peru/strings/String.h"

namespace peru {

// A major and a minor type, such as "audio" and "mpeg". Stored in lower case, since case is not significant.
class PERU_API CMimeType : public CObject {
public:
    CMimeType(const CStringArg& major, const CStringArg& minor);
    ~CMimeType() override;
    // Ignores parameters after a ";". Throws CParseError for an invalid type.
    static P<CMimeType> parse(const CStringArg& text);

    const P<IString>& getMajor() const { return m_major; }
    const P<IString>& getMinor() const { return m_minor; }
    P<IString> getAsString() const; // "audio/mpeg"
    bool equals(const P<CMimeType>& other) const;
    P<IString> getObjectDesc() const override;

private:
    P<IString> m_major;
    P<IString> m_minor;
};

} // namespace peru

// The generic URI syntax.
#pragma once

#include "peru/Object.h"
#include "peru/uri/IURI.h"

#include <memory>
#include <string>
#include <vector>

namespace peru {

class PERU_API CURI : public CObject, public IURI {
public:
    // Characters that stay unescaped in each component, besides letters, digits and "-_.!~*'()".
    static constexpr const char* kPathSet = ";:,/@&=+$";
    static constexpr const char* kQuerySet = ";:,/?@&=+$"; // also for the fragment
    static constexpr const char* kUserInfoSet = ";:,&=+$";

    // Parses a complete URI. Existing %XX sequences are kept. Throws CURIFormatError.
    explicit CURI(const CStringArg& text);
    // Composes a URI from unescaped parts: a "%" in them becomes "%25". Throws CURIFormatError if the port
    // text is neither empty nor a decimal number. A path without a leading "/" gets one if a host is given.
    CURI(const CStringArg& scheme, const CStringArg& host, const CStringArg& port, const CStringArg& userInfo,
         const CStringArg& path, const CStringArg& query, const CStringArg& fragment);
    CURI(const CURI& other);
    ~CURI() override;

    // "file:///" and the path with backslashes turned into slashes: the text form of a Windows path.
    static P<IString> getFileURI(const CStringArg& platformPath);
    // Replaces characters outside the set by %XX for each of their UTF-8 bytes. The bytes of a UTF-8 string
    // are used unchanged, so that names which are not valid UTF-8 survive.
    static P<IString> escape(const CStringArg& text, const char* keptCharacters);
    static P<IString> unescape(const CStringArg& text);

    bool hasScheme() const override;
    P<IString> getScheme() const override;
    bool hasSchemeSpecificPart() const override;
    P<IString> getSchemeSpecificPart() const override;
    bool hasAuthority() const override;
    P<IString> getAuthority() const override;
    bool hasUserInfo() const override;
    P<IString> getUserInfo() const override;
    bool hasHost() const override;
    P<IString> getHost() const override;
    bool hasPort() const override;
    P<IString> getPortText() const override;
    int32_t getPort() const override;
    bool hasPath() const override;
    P<IString> getPath() const override;
    P<IString> getUnescapedPath() const override;
    bool hasQuery() const override;
    P<IString> getQuery() const override;
    P<IString> getUnescapedQuery() const override;
    bool hasFragment() const override;
    P<IString> getFragment() const override;
    bool isRelative() const override;
    bool isHierarchical() const override;
    bool isDirectory() const override;
    P<IString> getAsString() const override;
    bool equals(const P<IURI>& other) const override;
    P<IString> getFileName() const override;
    P<IString> getExtension() const override;
    P<IURI> getParent() const override;
    P<IURI> appendPath(const CStringArg& relativePath) const override;
    P<IURI> makeRelativeTo(const P<IURI>& base) const override;
    P<IURI> resolveAgainst(const P<IURI>& base) const override;

    P<IString> getObjectDesc() const override;

private:
    struct SParts;
    explicit CURI(SParts&& parts);
    P<IURI> makeWithPath(std::vector<std::string> segments, bool absolute, bool directory) const;

    std::shared_ptr<const SParts> m_parts; // shared by copies
};

} // namespace peru

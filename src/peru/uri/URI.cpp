#include "peru/uri/URI.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/uri/URIEscapes.h"
#include "peru/uri/URIPath.h"

#include <algorithm>
#include <limits>

namespace peru {

// Every part is escaped and pure ASCII. The path is kept joined; its segments are derived when needed.
struct CURI::SParts {
    std::string scheme;
    std::string opaque; // the scheme-specific part of a URI that is not hierarchical
    std::string userInfo;
    std::string host;
    std::string portText;
    int32_t port = -1;
    std::string path;
    std::string query;
    std::string fragment;
    bool authority = false; // present, even if empty as in "file:///"
    bool hasQuery = false;
    bool hasFragment = false;
    bool relative = true;
    bool hierarchical = true;
    P<IString> text; // composed once: URIs are compared and shown more often than split

    std::string composeAuthority() const;
    std::string composeAfterScheme() const;
    void finish();
};

using namespace uri;

namespace {

// The sub-delimiters that stay unescaped in a host; ":" only in a bracketed one, where it is part of the
// address.
constexpr const char* kHostSet = ";,&=+$";
constexpr const char* kAddressSet = ";,&=+$:";

P<IString> toString(std::string_view text) {
    return text.empty() ? CString::empty() : CString::fromUTF8(text);
}

// Returns false if the text is neither empty, which gives -1, nor a decimal number of 31 bits.
bool parsePort(std::string_view text, int32_t& port) {
    int64_t value = 0;
    for (char c : text) {
        if (c < '0' || c > '9') return false;
        value = value * 10 + (c - '0');
        if (value > std::numeric_limits<int32_t>::max()) return false;
    }
    port = text.empty() ? -1 : static_cast<int32_t>(value);
    return true;
}

std::string asBytes(const P<IString>& text) {
    return CString::toStdString(text);
}

} // namespace

std::string CURI::SParts::composeAuthority() const {
    std::string out;
    if (!userInfo.empty()) out += userInfo + "@";
    out += host;
    if (!portText.empty()) out += ":" + portText;
    return out;
}

std::string CURI::SParts::composeAfterScheme() const {
    if (!hierarchical) return opaque;
    std::string out;
    if (authority)
        out = "//" + composeAuthority();
    else if (path.starts_with("//"))
        out = "/."; // otherwise the first segment would be parsed as an authority
    else if (relative && path.substr(0, path.find('/')).find(':') != std::string::npos)
        out = "./"; // otherwise the text before the ":" would be parsed as a scheme
    out += path;
    if (hasQuery) out += "?" + query;
    if (hasFragment) out += "#" + fragment;
    return out;
}

void CURI::SParts::finish() {
    std::string composed = composeAfterScheme();
    if (!relative) composed.insert(0, scheme + ":");
    text = toString(composed);
}

CURI::CURI(const CStringArg& text) {
    const std::string bytes = CString::toStdString(text);
    std::string_view rest = bytes;
    SParts parts;

    const size_t delimiter = rest.find_first_of(":/?#");
    if (delimiter != std::string_view::npos && rest[delimiter] == ':') {
        parts.scheme = escapeUnprintable(rest.substr(0, delimiter));
        parts.relative = false;
        rest.remove_prefix(delimiter + 1);
        if (!rest.starts_with('/')) {
            parts.hierarchical = false;
            parts.opaque = escapeUnprintable(rest);
            parts.finish();
            m_parts = std::make_shared<const SParts>(std::move(parts));
            return;
        }
    }

    if (rest.starts_with("//")) {
        parts.authority = true;
        rest.remove_prefix(2);
        std::string_view authority = rest.substr(0, rest.find_first_of("/?#"));
        rest.remove_prefix(authority.size());
        if (const size_t at = authority.rfind('@'); at != std::string_view::npos) {
            parts.userInfo = escapeBytes(authority.substr(0, at), kUserInfoSet, EPercent::keepEscapes);
            authority.remove_prefix(at + 1);
        }
        const bool bracketed = authority.starts_with('[');
        size_t hostEnd = authority.rfind(':');
        if (bracketed) {
            hostEnd = authority.find(']');
            if (hostEnd == std::string_view::npos) throw CURIFormatError(text);
            ++hostEnd;
            if (hostEnd < authority.size() && authority[hostEnd] != ':') throw CURIFormatError(text);
        }
        const std::string_view host = authority.substr(0, hostEnd);
        authority.remove_prefix(host.size());
        if (!authority.empty()) authority.remove_prefix(1);
        if (bracketed)
            parts.host =
                "[" + escapeBytes(host.substr(1, host.size() - 2), kAddressSet, EPercent::keepEscapes) + "]";
        else
            parts.host = escapeBytes(host, kHostSet, EPercent::keepEscapes);
        parts.portText = authority;
        if (!parsePort(authority, parts.port)) throw CURIFormatError(text);
    }

    const std::string_view path = rest.substr(0, rest.find_first_of("?#"));
    rest.remove_prefix(path.size());
    parts.path = normalizePath(escapeBytes(path, kPathSet, EPercent::keepEscapes));
    if (rest.starts_with('?')) {
        rest.remove_prefix(1);
        const std::string_view query = rest.substr(0, rest.find('#'));
        rest.remove_prefix(query.size());
        parts.query = escapeBytes(query, kQuerySet, EPercent::keepEscapes);
        parts.hasQuery = true;
    }
    if (rest.starts_with('#')) {
        parts.fragment = escapeBytes(rest.substr(1), kQuerySet, EPercent::keepEscapes);
        parts.hasFragment = true;
    }
    parts.finish();
    m_parts = std::make_shared<const SParts>(std::move(parts));
}

CURI::CURI(const CStringArg& scheme, const CStringArg& host, const CStringArg& port,
           const CStringArg& userInfo, const CStringArg& path, const CStringArg& query,
           const CStringArg& fragment) {
    SParts parts;
    parts.scheme = escapeBytes(CString::toStdString(scheme), "+", EPercent::escape);
    parts.relative = parts.scheme.empty();

    std::string hostBytes = CString::toStdString(host);
    const bool bracketed = hostBytes.starts_with('[') && hostBytes.ends_with(']');
    if (bracketed) hostBytes = hostBytes.substr(1, hostBytes.size() - 2);
    if (bracketed || hostBytes.find(':') != std::string::npos)
        parts.host = "[" + escapeBytes(hostBytes, kAddressSet, EPercent::escape) + "]";
    else
        parts.host = escapeBytes(hostBytes, kHostSet, EPercent::escape);
    parts.userInfo = escapeBytes(CString::toStdString(userInfo), kUserInfoSet, EPercent::escape);
    parts.portText = CString::toStdString(port);
    parts.authority = !parts.host.empty() || !parts.userInfo.empty() || !parts.portText.empty();

    parts.path = escapeBytes(CString::toStdString(path), kPathSet, EPercent::escape);
    if (parts.authority && !parts.path.empty() && !parts.path.starts_with('/')) parts.path.insert(0, "/");
    parts.query = escapeBytes(CString::toStdString(query), kQuerySet, EPercent::escape);
    parts.hasQuery = !parts.query.empty();
    parts.fragment = escapeBytes(CString::toStdString(fragment), kQuerySet, EPercent::escape);
    parts.hasFragment = !parts.fragment.empty();

    if (!parsePort(parts.portText, parts.port)) {
        parts.portText = escapeUnprintable(parts.portText);
        parts.finish();
        throw CURIFormatError(CStringArg(parts.text));
    }
    if (!parts.relative && !parts.authority && parts.path.starts_with('/') && parts.scheme == "file")
        parts.authority = true; // the usual form, so that both ways to name a file compare equal
    if (!parts.relative && !parts.authority && !parts.path.starts_with('/')) {
        // The text would be parsed as an opaque URI, so it is one.
        parts.opaque = parts.composeAfterScheme();
        parts.hierarchical = false;
        parts.path.clear();
        parts.query.clear();
        parts.fragment.clear();
        parts.hasQuery = parts.hasFragment = false;
    } else {
        parts.path = normalizePath(parts.path);
    }
    parts.finish();
    m_parts = std::make_shared<const SParts>(std::move(parts));
}

CURI::CURI(const CURI& other) : CObject(), m_parts(other.m_parts) {}

CURI::CURI(SParts&& parts) {
    parts.finish();
    m_parts = std::make_shared<const SParts>(std::move(parts));
}

CURI::~CURI() = default;

P<IString> CURI::getFileURI(const CStringArg& platformPath) {
    std::string path = CString::toStdString(platformPath);
    for (char& c : path)
        if (c == '\\') c = '/';
    return toString("file:///" + path);
}

P<IString> CURI::escape(const CStringArg& text, const char* keptCharacters) {
    return toString(escapeBytes(CString::toStdString(text), keptCharacters, EPercent::escape));
}

P<IString> CURI::unescape(const CStringArg& text) {
    return toString(unescapeBytes(CString::toStdString(text)));
}

bool CURI::hasScheme() const {
    return !m_parts->relative;
}

P<IString> CURI::getScheme() const {
    return toString(m_parts->scheme);
}

bool CURI::hasSchemeSpecificPart() const {
    return !m_parts->composeAfterScheme().empty();
}

P<IString> CURI::getSchemeSpecificPart() const {
    return toString(m_parts->composeAfterScheme());
}

bool CURI::hasAuthority() const {
    return m_parts->authority;
}

P<IString> CURI::getAuthority() const {
    return toString(m_parts->composeAuthority());
}

bool CURI::hasUserInfo() const {
    return !m_parts->userInfo.empty();
}

P<IString> CURI::getUserInfo() const {
    return toString(m_parts->userInfo);
}

bool CURI::hasHost() const {
    return !m_parts->host.empty();
}

P<IString> CURI::getHost() const {
    return toString(m_parts->host);
}

bool CURI::hasPort() const {
    return m_parts->port >= 0;
}

P<IString> CURI::getPortText() const {
    return toString(m_parts->portText);
}

int32_t CURI::getPort() const {
    return m_parts->port;
}

bool CURI::hasPath() const {
    return !m_parts->path.empty();
}

P<IString> CURI::getPath() const {
    return toString(m_parts->path);
}

P<IString> CURI::getUnescapedPath() const {
    return toString(unescapeBytes(m_parts->path));
}

bool CURI::hasQuery() const {
    return m_parts->hasQuery;
}

P<IString> CURI::getQuery() const {
    return toString(m_parts->query);
}

P<IString> CURI::getUnescapedQuery() const {
    return toString(unescapeBytes(m_parts->query));
}

bool CURI::hasFragment() const {
    return m_parts->hasFragment;
}

P<IString> CURI::getFragment() const {
    return toString(m_parts->fragment);
}

bool CURI::isRelative() const {
    return m_parts->relative;
}

bool CURI::isHierarchical() const {
    return m_parts->hierarchical;
}

bool CURI::isDirectory() const {
    return m_parts->path.ends_with('/');
}

P<IString> CURI::getAsString() const {
    return m_parts->text;
}

bool CURI::equals(const P<IURI>& other) const {
    return other && m_parts->text->equals(other->getAsString());
}

P<IString> CURI::getFileName() const {
    const SPath path = splitPath(m_parts->path);
    return path.segments.empty() ? CString::empty() : toString(path.segments.back());
}

P<IString> CURI::getExtension() const {
    const SPath path = splitPath(m_parts->path);
    if (path.segments.empty()) return CString::empty();
    std::string_view name = path.segments.back();
    name.remove_prefix(std::min(name.find_first_not_of('.'), name.size()));
    const size_t point = name.rfind('.');
    return point == std::string_view::npos ? CString::empty() : toString(name.substr(point + 1));
}

// This URI's scheme and authority with another path, without query and fragment.
P<IURI> CURI::makeWithPath(std::vector<std::string> segments, bool absolute, bool directory) const {
    SPath path{std::move(segments), absolute, directory};
    normalize(path);
    SParts parts = *m_parts;
    parts.path = joinPath(path);
    parts.query.clear();
    parts.fragment.clear();
    parts.hasQuery = parts.hasFragment = false;
    return P<IURI>(new CURI(std::move(parts)));
}

P<IURI> CURI::getParent() const {
    if (!m_parts->hierarchical) return nullptr;
    SPath path = splitPath(m_parts->path);
    if (path.segments.empty() || path.segments.back() == "..") return nullptr;
    path.segments.pop_back();
    return makeWithPath(std::move(path.segments), path.absolute, true);
}

P<IURI> CURI::appendPath(const CStringArg& relativePath) const {
    if (!m_parts->hierarchical)
        throw CURIError(localize("peru.CURI.appendToOpaque",
                                 "A path cannot be appended to the URI '%URI%', which has none."),
                        make<CURI>(*this));
    SPath path = splitPath(m_parts->path);
    if (m_parts->authority) path.absolute = true;
    std::string escaped = escapeBytes(CString::toStdString(relativePath), kPathSet, EPercent::escape);
    if (escaped.empty()) return makeWithPath(std::move(path.segments), path.absolute, path.directory);
    SPath tail = splitPath(escaped);
    path.segments.insert(path.segments.end(), tail.segments.begin(), tail.segments.end());
    return makeWithPath(std::move(path.segments), path.absolute, tail.directory);
}

P<IURI> CURI::makeRelativeTo(const P<IURI>& base) const {
    const P<IURI> same = make<CURI>(*this);
    if (m_parts->relative || !m_parts->hierarchical || !base || !base->isHierarchical()) return same;
    // A relative base has no scheme, which is not the same as the empty one of ":/a".
    if (base->isRelative() || !base->getScheme()->equals(getScheme()) ||
        base->hasAuthority() != m_parts->authority || !base->getAuthority()->equals(getAuthority()))
        return same;

    SPath target = splitPath(m_parts->path);
    const SPath from = splitPath(asBytes(base->getPath()));
    const size_t limit = std::min(target.getDirectoryDepth(), from.getDirectoryDepth());
    size_t common = 0;
    while (common < limit && target.segments[common] == from.segments[common]) ++common;
    if (common == 0) return same;

    SPath path;
    path.directory = target.directory;
    path.segments.assign(from.getDirectoryDepth() - common, "..");
    path.segments.insert(path.segments.end(), target.segments.begin() + static_cast<ptrdiff_t>(common),
                         target.segments.end());
    SParts parts = *m_parts;
    parts.path = path.segments.empty() ? std::string() : joinPath(path);
    parts.scheme.clear();
    parts.userInfo.clear();
    parts.host.clear();
    parts.portText.clear();
    parts.port = -1;
    parts.authority = false;
    parts.relative = true;
    return P<IURI>(new CURI(std::move(parts)));
}

P<IURI> CURI::resolveAgainst(const P<IURI>& base) const {
    if (!m_parts->relative || !base) return make<CURI>(*this);
    if (!base->isHierarchical())
        throw CURIError(localize("peru.CURI.resolveAgainstOpaque",
                                 "A relative URI cannot be resolved against '%URI%', which has no path."),
                        base);
    const P<CURI> origin = tryCast<CURI>(base) ? tryCast<CURI>(base) : make<CURI>(base->getAsString());
    SParts parts = *m_parts;
    parts.scheme = origin->m_parts->scheme;
    parts.relative = origin->m_parts->relative;
    SPath path = splitPath(m_parts->path);
    if (!m_parts->authority) {
        const SParts& from = *origin->m_parts;
        parts.authority = from.authority;
        parts.userInfo = from.userInfo;
        parts.host = from.host;
        parts.portText = from.portText;
        parts.port = from.port;
        if (!path.absolute) {
            SPath folder = splitPath(from.path);
            folder.segments.resize(folder.getDirectoryDepth());
            path.absolute = folder.absolute || from.authority;
            path.segments.insert(path.segments.begin(), folder.segments.begin(), folder.segments.end());
        }
        normalize(path);
        parts.path = joinPath(path);
    }
    return P<IURI>(new CURI(std::move(parts)));
}

P<IString> CURI::getObjectDesc() const {
    return m_parts->text;
}

} // namespace peru

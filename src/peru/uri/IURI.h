// Names of files, resources, network places and virtual objects.
#pragma once

#include "peru/strings/String.h"

namespace peru {

// Immutable. The get operations return escaped text, empty where the part is absent.
class PERU_API IURI : public virtual IBase {
public:
    virtual bool hasScheme() const = 0;
    virtual P<IString> getScheme() const = 0;
    virtual bool hasSchemeSpecificPart() const = 0;
    virtual P<IString> getSchemeSpecificPart() const = 0; // all that follows the scheme and its ":"
    virtual bool hasAuthority() const = 0;
    virtual P<IString> getAuthority() const = 0;
    virtual bool hasUserInfo() const = 0;
    virtual P<IString> getUserInfo() const = 0;
    virtual bool hasHost() const = 0;
    virtual P<IString> getHost() const = 0;
    virtual bool hasPort() const = 0;
    virtual P<IString> getPortText() const = 0;
    virtual int32_t getPort() const = 0; // -1 when absent
    virtual bool hasPath() const = 0;
    virtual P<IString> getPath() const = 0;
    virtual P<IString> getUnescapedPath() const = 0; // a UTF-8 string whose bytes are the escaped ones
    virtual bool hasQuery() const = 0;
    virtual P<IString> getQuery() const = 0;
    virtual P<IString> getUnescapedQuery() const = 0;
    virtual bool hasFragment() const = 0;
    virtual P<IString> getFragment() const = 0;

    virtual bool isRelative() const = 0;     // no scheme was found
    virtual bool isHierarchical() const = 0; // clear for an absolute URI whose rest does not start with "/"
    virtual bool isDirectory() const = 0;    // the path ends in "/"

    virtual P<IString> getAsString() const = 0; // the whole text, pure ASCII
    virtual bool equals(const P<IURI>& other) const = 0;

    // The last segment of the path, escaped; that of a directory without its slash.
    virtual P<IString> getFileName() const = 0;
    // Of the file name, without its point; empty without one. The point of ".profile" starts no extension.
    virtual P<IString> getExtension() const = 0;
    // The directory above, without query and fragment; empty for a root, and for what has no known parent:
    // opaque URIs and relative ones that stand for the directory they are resolved against, or for one above.
    virtual P<IURI> getParent() const = 0;
    // The path goes below this one, whether or not that ends in a slash; query and fragment are dropped.
    // `relativePath` is unescaped text with "/" between its segments. Throws CURIError for an opaque URI.
    virtual P<IURI> appendPath(const CStringArg& relativePath) const = 0;
    // The same URI where there is no way from the base to it: other scheme or authority, no directory in
    // common. Otherwise resolveAgainst() the same base gives this URI again.
    virtual P<IURI> makeRelativeTo(const P<IURI>& base) const = 0;
    // The same URI when it is absolute. An empty relative path stands for the base's directory. Throws
    // CURIError for an opaque base.
    virtual P<IURI> resolveAgainst(const P<IURI>& base) const = 0;
};

} // namespace peru

// Names of files, resources, network locations and virtual objects.
#pragma once

#include "peru/strings/String.h"

namespace peru {

// Immutable. The get operations return escaped text, empty if the part is absent.
class PERU_API IURI : public virtual IBase {
public:
    virtual bool hasScheme() const = 0;
    virtual P<IString> getScheme() const = 0;
    virtual bool hasSchemeSpecificPart() const = 0;
    virtual P<IString> getSchemeSpecificPart() const = 0; // everything after the scheme and its ":"
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
    virtual P<IString> getUnescapedPath() const = 0; // of the unescaped bytes, see CString::fromUTF8
    virtual bool hasQuery() const = 0;
    virtual P<IString> getQuery() const = 0;
    virtual P<IString> getUnescapedQuery() const = 0;
    virtual bool hasFragment() const = 0;
    virtual P<IString> getFragment() const = 0;

    virtual bool isRelative() const = 0;     // no scheme was found
    virtual bool isHierarchical() const = 0; // false for an absolute URI whose rest does not start with "/"
    virtual bool isDirectory() const = 0;    // the path ends in "/"

    virtual P<IString> getAsString() const = 0; // the whole text, pure ASCII
    virtual bool equals(const P<IURI>& other) const = 0;

    // The last segment of the path, escaped; for a directory without its slash.
    virtual P<IString> getFileName() const = 0;
    // The extension of the file name without the dot, empty if there is none. The dot of ".profile" does not
    // start an extension.
    virtual P<IString> getExtension() const = 0;
    // The parent directory, without query and fragment. Empty for a root and if the parent is unknown: for
    // opaque URIs, and for relative ones that stand for the directory they are resolved against or for one
    // above it.
    virtual P<IURI> getParent() const = 0;
    // Appends the path to this one, whether or not that ends in a slash, and drops query and fragment.
    // `relativePath` is unescaped text with "/" between its segments. Throws CURIError for an opaque URI.
    virtual P<IURI> appendPath(const CStringArg& relativePath) const = 0;
    // Returns the same URI if it cannot be relative to the base: scheme or authority differ, or there is no
    // common directory. Otherwise resolveAgainst() with the same base restores this URI.
    virtual P<IURI> makeRelativeTo(const P<IURI>& base) const = 0;
    // Returns the same URI if it is absolute. An empty relative path stands for the base's directory. Throws
    // CURIError for an opaque base.
    virtual P<IURI> resolveAgainst(const P<IURI>& base) const = 0;
};

} // namespace peru

// Shared by this platform's file classes: descriptors, paths of URIs, error texts.
#pragma once

#include "peru/uri/IURI.h"

#include <string>
#include <utility>

namespace peru::posix {

// Owns a file descriptor.
class CFileHandle {
public:
    explicit CFileHandle(int descriptor = -1) noexcept : m_descriptor(descriptor) {}
    CFileHandle(CFileHandle&& other) noexcept : m_descriptor(std::exchange(other.m_descriptor, -1)) {}
    CFileHandle& operator=(CFileHandle&& other) noexcept {
        std::swap(m_descriptor, other.m_descriptor);
        return *this;
    }
    ~CFileHandle() { close(); }

    bool isOpen() const { return m_descriptor >= 0; }
    int get() const { return m_descriptor; }
    // False if the system reports a deferred write error.
    bool close() noexcept;

private:
    int m_descriptor;
};

// The bytes of the URI's path without a trailing "/", so that a call on a link affects the link itself.
// Throws CURITypeNotSupportedError if the URI is not a path on this machine.
std::string toPath(const P<IURI>& uri);
// The same, but returns an empty path instead of throwing.
PERU_API std::string tryToPath(const P<IURI>& uri);
// A folder's URI ends in "/".
PERU_API P<IURI> toURI(const std::string& path);
PERU_API P<IURI> toFolderURI(std::string path);

// The system's text for an errno value.
P<IString> getSystemText(int error);

} // namespace peru::posix

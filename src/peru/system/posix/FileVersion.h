// The version of a shared library.
#pragma once

#include "peru/Object.h"
#include "peru/uri/IURI.h"

namespace peru::posix {

class CFileVersion : public CObject {
public:
    // Empty if the file cannot be read or is not a shared library of this machine's word size.
    static P<CFileVersion> read(const P<IURI>& file);

    // The name that programs are linked with, such as "libgio-2.0.so.0"; empty when the library has none.
    const P<IString>& getSoname() const { return m_soname; }
    // What follows ".so." in the file's own name after resolving links ("0.7400.6"), otherwise in its SONAME;
    // empty if neither contains a version.
    const P<IString>& getVersion() const { return m_version; }

private:
    CFileVersion(P<IString> soname, P<IString> version)
        : m_soname(std::move(soname)), m_version(std::move(version)) {}
    template <class T, class... Args> friend P<T> peru::make(Args&&... args);

    P<IString> m_soname;
    P<IString> m_version;
};

} // namespace peru::posix

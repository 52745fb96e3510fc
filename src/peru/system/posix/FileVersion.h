// The version that a shared library carries.
#pragma once

#include "peru/Object.h"
#include "peru/uri/IURI.h"

namespace peru::posix {

class CFileVersion : public CObject {
public:
    // Empty when the file cannot be read or is no shared library of this machine's kind.
    static P<CFileVersion> read(const P<IURI>& file);

    // The name that programs are linked with, such as "libgio-2.0.so.0"; empty when the library has none.
    const P<IString>& getSoname() const { return m_soname; }
    // What follows ".so." in the file's own name ("0.7400.6"), else in its SONAME; empty when neither
    // tells. Links are followed to the file first.
    const P<IString>& getVersion() const { return m_version; }

private:
    CFileVersion(P<IString> soname, P<IString> version)
        : m_soname(std::move(soname)), m_version(std::move(version)) {}
    template <class T, class... Args> friend P<T> peru::make(Args&&... args);

    P<IString> m_soname;
    P<IString> m_version;
};

} // namespace peru::posix

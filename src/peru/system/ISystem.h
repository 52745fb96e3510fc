// What the platform does in one call.
#pragma once

#include "peru/files/IFileReplacement.h"
#include "peru/uri/IURI.h"

#include <vector>

namespace peru {

class PERU_API ISystem : public virtual IBase {
public:
    virtual P<IURI> getMainExecutableFile() = 0;  // empty when it cannot be told
    virtual P<IURI> getProgramFileFolder() = 0;   // the folder of the main executable
    virtual P<IURI> getDataFolder() = 0;          // $XDG_DATA_HOME, with a trailing "/"
    virtual P<IURI> getConfigurationFolder() = 0; // $XDG_CONFIG_HOME
    virtual P<IURI> getTemporaryFolder() = 0;     // $TMPDIR
    // Where this library's own parts are looked for, in order: the environment variable (a list separated
    // by ":"), the folder of libperu.so, `installed` below the installation prefix.
    virtual std::vector<P<IURI>> getSearchFolders(const char* environmentVariable, const char* installed) = 0;

    // Both make an empty file or folder with a name of its own and say where. Throw CFileError.
    virtual P<IURI> createUniqueFile(const P<IURI>& folder, const CStringArg& prefix,
                                     const CStringArg& extension) = 0;
    virtual P<IURI> createUniqueFolder(const P<IURI>& folder, const CStringArg& prefix) = 0;
    // A copy never replaces: throws CFileError when the destination exists.
    virtual void copyFile(const P<IURI>& source, const P<IURI>& destination) = 0;
    virtual void moveFile(const P<IURI>& source, const P<IURI>& destination) = 0;   // within a volume
    virtual void moveFolder(const P<IURI>& source, const P<IURI>& destination) = 0; // within a volume
    // Version of a shared library of the platform, such as "libgio-2.0.so.0"; empty when it is not there.
    virtual P<IString> getLibraryVersion(const CStringArg& libraryName) = 0;
    // Makes the bytes the whole content of a file, which need not exist. They are written beside it and take
    // its name once they are on the medium; mode and links stay. Throws CFileError with the file as it was.
    virtual void replaceFile(const P<IURI>& file, const void* data, int64_t size) = 0;
    // The same for content that is written bit by bit or partly taken from the old file. Throws CFileError, a
    // CFileAccessDeniedError for a file that the user may not write.
    virtual P<IFileReplacement> startReplacement(const P<IURI>& file) = 0;
};

PERU_API P<ISystem> getSystem();

} // namespace peru

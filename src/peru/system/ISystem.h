// Folders of the user and operations that the platform offers directly.
#pragma once

#include "peru/files/IFileReplacement.h"
#include "peru/uri/IURI.h"

#include <vector>

namespace peru {

class PERU_API ISystem : public virtual IBase {
public:
    virtual P<IURI> getMainExecutableFile() = 0;  // empty if it cannot be determined
    virtual P<IURI> getProgramFileFolder() = 0;   // the folder of the main executable
    virtual P<IURI> getDataFolder() = 0;          // $XDG_DATA_HOME, with a trailing "/"
    virtual P<IURI> getConfigurationFolder() = 0; // $XDG_CONFIG_HOME
    virtual P<IURI> getTemporaryFolder() = 0;     // $TMPDIR
    // The search path for this library's own parts, in order: the environment variable (a list separated by
    // ":"), the folder of libperu.so, `installed` below the installation prefix.
    virtual std::vector<P<IURI>> getSearchFolders(const char* environmentVariable, const char* installed) = 0;

    // Both create an empty file or folder with a unique name and return its location. Throw CFileError.
    virtual P<IURI> createUniqueFile(const P<IURI>& folder, const CStringArg& prefix,
                                     const CStringArg& extension) = 0;
    virtual P<IURI> createUniqueFolder(const P<IURI>& folder, const CStringArg& prefix) = 0;
    // Never replaces a file: throws CFileError if the destination exists.
    virtual void copyFile(const P<IURI>& source, const P<IURI>& destination) = 0;
    virtual void moveFile(const P<IURI>& source, const P<IURI>& destination) = 0;   // within a volume
    virtual void moveFolder(const P<IURI>& source, const P<IURI>& destination) = 0; // within a volume
    // Version of a shared library of the platform, such as "libgio-2.0.so.0"; empty if it is not installed.
    virtual P<IString> getLibraryVersion(const CStringArg& libraryName) = 0;
    // Replaces the content of a file, or creates the file. The bytes are written beside it and take its name
    // once they are on the disk; mode and links are preserved. Throws CFileError and leaves the file
    // unchanged.
    virtual void replaceFile(const P<IURI>& file, const void* data, int64_t size) = 0;
    // The same for content that is written in pieces or partly copied from the old file. Throws CFileError,
    // or CFileAccessDeniedError if the user may not write the file.
    virtual P<IFileReplacement> startReplacement(const P<IURI>& file) = 0;
    virtual P<IURI> getCacheFolder() = 0; // $XDG_CACHE_HOME, with a trailing "/"
};

PERU_API P<ISystem> getSystem();

} // namespace peru

// Folders of the user, unique names and whole-file operations of this platform.
#pragma once

#include "peru/Object.h"
#include "peru/system/ISystem.h"

namespace peru::posix {

// Stateless; thread-safe as long as nobody changes the environment. An environment variable that does not
// hold an absolute path counts as not set.
class CSystem : public CObject, public ISystem {
public:
    P<IURI> getMainExecutableFile() override;
    P<IURI> getProgramFileFolder() override;
    P<IURI> getDataFolder() override;
    P<IURI> getConfigurationFolder() override;
    P<IURI> getTemporaryFolder() override;
    // The folders need not exist.
    std::vector<P<IURI>> getSearchFolders(const char* environmentVariable, const char* installed) override;

    // An empty handle means the temporary folder. Only the user has access to the result (0600, 0700).
    P<IURI> createUniqueFile(const P<IURI>& folder, const CStringArg& prefix,
                             const CStringArg& extension) override;
    P<IURI> createUniqueFolder(const P<IURI>& folder, const CStringArg& prefix) override;
    // Follows links. Copies mode and times; a failed copy is removed.
    void copyFile(const P<IURI>& source, const P<IURI>& destination) override;
    // Neither replaces anything. A link is moved as a link.
    void moveFile(const P<IURI>& source, const P<IURI>& destination) override;
    void moveFolder(const P<IURI>& source, const P<IURI>& destination) override;
    P<IString> getLibraryVersion(const CStringArg& libraryName) override;
    // Refuses a target that is not a regular file or that the user may not write.
    void replaceFile(const P<IURI>& file, const void* data, int64_t size) override;
    P<IFileReplacement> startReplacement(const P<IURI>& file) override;
    P<IURI> getCacheFolder() override;
};

} // namespace peru::posix

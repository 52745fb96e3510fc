// Folders of the user, unique names and whole-file operations of this platform.
#pragma once

#include "peru/Object.h"
#include "peru/system/ISystem.h"

namespace peru::posix {

// Stateless; safe from any thread as long as nobody changes the environment. A variable of the environment
// that does not hold an absolute path counts as not set.
class CSystem : public CObject, public ISystem {
public:
    P<IURI> getMainExecutableFile() override;
    P<IURI> getProgramFileFolder() override;
    P<IURI> getDataFolder() override;
    P<IURI> getConfigurationFolder() override;
    P<IURI> getTemporaryFolder() override;
    // Not all of them need to exist.
    std::vector<P<IURI>> getSearchFolders(const char* environmentVariable, const char* installed) override;

    // An empty folder is the temporary one. What is made belongs to the user alone (0600, 0700).
    P<IURI> createUniqueFile(const P<IURI>& folder, const CStringArg& prefix,
                             const CStringArg& extension) override;
    P<IURI> createUniqueFolder(const P<IURI>& folder, const CStringArg& prefix) override;
    // Follows links. Mode and times come along; a copy that fails leaves nothing.
    void copyFile(const P<IURI>& source, const P<IURI>& destination) override;
    // Neither replaces anything. A link is moved as such.
    void moveFile(const P<IURI>& source, const P<IURI>& destination) override;
    void moveFolder(const P<IURI>& source, const P<IURI>& destination) override;
    P<IString> getLibraryVersion(const CStringArg& libraryName) override;
    // Refuses what is no regular file, and one that the user may not write.
    void replaceFile(const P<IURI>& file, const void* data, int64_t size) override;
    P<IFileReplacement> startReplacement(const P<IURI>& file) override;
};

} // namespace peru::posix

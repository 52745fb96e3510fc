// The implementation of IFileSystemManager: look-up, and copying and moving in steps.
#pragma once

#include "peru/files/IFileSystemManager.h"
#include "peru/threads/IMutex.h"

#include <vector>

namespace peru {

class PERU_API CFileSystemManager : public CObject, public IFileSystemManager {
public:
    CFileSystemManager();
    ~CFileSystemManager() override;

    bool exists(const P<IURI>& uri) override;
    bool isFile(const P<IURI>& uri) override;
    bool isFolder(const P<IURI>& uri) override;
    int64_t getFileSize(const P<IURI>& uri) override;
    void createFolder(const P<IURI>& uri) override;
    void deleteFile(const P<IURI>& uri) override;
    void deleteFolder(const P<IURI>& uri) override;
    void copy(const P<IURI>& source, const P<IURI>& destination) override;
    void move(const P<IURI>& source, const P<IURI>& destination) override;
    P<IFileObjectCursor> enumerate(const P<IURI>& folder) override;
    P<IFileObject> getFileObject(const P<IURI>& uri) override;
    P<CFileTimes> getTimes(const P<IURI>& uri) override;
    void setTimes(const P<IURI>& uri, const P<CFileTimes>& times) override;
    SFileAttributes getAttributes(const P<IURI>& uri) override;
    void deleteUndoable(const P<IURI>& uri) override;
    void mount(const P<IFileSystem>& fileSystem) override;
    void mountScheme(const CStringArg& scheme, const P<IFileSystem>& fileSystem) override;
    void unmount(const P<IFileSystem>& fileSystem) override;
    P<IFileSystem> getFileSystem(const P<IURI>& uri) override;

private:
    struct SMount {
        P<IString> scheme; // empty: decided by IFileSystem::handles
        P<IFileSystem> fileSystem;
    };
    // Both ends of a copy or move.
    struct SRoute {
        P<IURI> source;
        P<IURI> destination;
        P<IFileSystem> from;
        P<IFileSystem> to;
    };

    P<IFileSystem> requireFileSystem(const P<IURI>& uri);
    P<IFileObject> requireFileObject(const P<IURI>& uri);
    SRoute makeRoute(const P<IURI>& source, const P<IURI>& destination);
    void copyObject(const SRoute& route, const P<IFileObject>& object, bool keepLink);
    void copyFolder(const SRoute& route, const P<IFileObject>& folder);
    void fillFolder(const SRoute& route, const P<IFileObject>& folder);
    void moveFile(const SRoute& route, const P<IFileObject>& object);
    void moveFolder(const SRoute& route, const P<IFileObject>& folder);

    P<IMutex> m_mutex; // guards m_mounts; never held while a file system is called
    std::vector<SMount> m_mounts;
};

} // namespace peru

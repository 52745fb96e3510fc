// A file or folder on disk, and enumeration of a folder's children.
#pragma once

#include "peru/files/IFileObject.h"

#include <dirent.h>
#include <memory>
#include <string>

namespace peru::posix {

class CFileSystemFileObject : public CObject, public virtual IFileObject {
public:
    // Empty if nothing exists at the path. Throws CFileError if that cannot be determined.
    static P<IFileObject> find(const std::string& path);

    P<IURI> getURI() override;
    P<IString> getName() override;
    P<IString> getDisplayName() override;
    bool isFile() override { return m_file; }
    bool isFolder() override { return m_folder; }
    int64_t getSize() override { return m_size; }
    P<peru::CFileTimes> getTimes() override { return m_times; }
    SFileAttributes getAttributes() override { return m_attributes; }
    // Derived from the name alone: the file is not opened.
    P<IString> getKind() override;
    P<IFileObjectCursor> enumerate() override;

protected:
    CFileSystemFileObject() = default;
    ~CFileSystemFileObject() override = default;
    template <class T, class... Args> friend P<T> peru::make(Args&&... args);
    // Returns 0 if the file was found, otherwise an errno value.
    int look(const std::string& path);

private:
    std::string m_path;
    bool m_file = false;
    bool m_folder = false;
    int64_t m_size = 0;
    P<peru::CFileTimes> m_times;
    SFileAttributes m_attributes;
};

// Skips a child that is deleted while the folder is being read.
class CFileSystemFolderCursor : public CObject, public IFileObjectCursor {
public:
    // Throws CFileError if the path is not a folder or cannot be read.
    static P<IFileObjectCursor> open(const std::string& path);

    bool next() override;
    P<IFileObject> getFileObject() override;
    void reset() override;

private:
    struct SCloser {
        void operator()(DIR* folder) const { ::closedir(folder); }
    };
    CFileSystemFolderCursor(std::string path, DIR* folder);
    template <class T, class... Args> friend P<T> peru::make(Args&&... args);

    std::string m_path;
    std::unique_ptr<DIR, SCloser> m_folder;
    P<IFileObject> m_current;
};

} // namespace peru::posix

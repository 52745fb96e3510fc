// The desktop's view of files: what GIO knows of them, also beyond the disks.
#pragma once

#include "peru/files/IFileObject.h"
#include "peru/files/posix/GObjectPointer.h"

namespace peru::posix {

// A place of the desktop's name space, such as a folder, "trash:///" or "network:///". Belongs to one thread.
class PERU_API CShellFolder : public CObject {
public:
    // Throws CFileError when the place is not there or holds no items.
    static P<CShellFolder> bind(const P<IURI>& uri);

    P<IURI> getURI();
    // What is in it. Throws CFileError.
    P<IFileObjectCursor> enumerate();
    // Of one item, by its own name. Both throw CFileError.
    P<IString> getItemName(const CStringArg& name);
    SFileAttributes getItemAttributes(const CStringArg& name);

private:
    explicit CShellFolder(TGObject<GFile> file) : m_file(std::move(file)) {}
    template <class T, class... Args> friend P<T> peru::make(Args&&... args);

    TGObject<GFile> m_file;
};

// An item as the desktop shows it. Belongs to one thread.
class PERU_API CShellFileObject : public CObject, public IFileObject {
public:
    // Throws CFileError when there is no such item.
    static P<CShellFileObject> find(const P<IURI>& uri);
    CShellFileObject(TGObject<GFile> file, TGObject<GFileInfo> info);

    P<IURI> getURI() override;
    P<IString> getName() override;
    P<IString> getDisplayName() override;
    bool isFile() override;
    bool isFolder() override;
    int64_t getSize() override;
    P<peru::CFileTimes> getTimes() override;
    SFileAttributes getAttributes() override;
    P<IString> getKind() override; // where its name does not tell, from its first bytes
    P<IFileObjectCursor> enumerate() override;

    P<IString> getKindDescription(); // in the user's language
    P<IString> getIconName();        // of the icon theme; empty when there is none

protected:
    ~CShellFileObject() override;

private:
    TGObject<GFile> m_file;
    TGObject<GFileInfo> m_info;
};

class PERU_API CShellFolderCursor : public CObject, public IFileObjectCursor {
public:
    static P<IFileObjectCursor> open(GFile* folder);

    bool next() override;
    P<IFileObject> getFileObject() override;
    void reset() override;

private:
    explicit CShellFolderCursor(GFile* folder);
    template <class T, class... Args> friend P<T> peru::make(Args&&... args);

    TGObject<GFile> m_folder;
    TGObject<GFileEnumerator> m_items;
    P<IFileObject> m_current;
};

// The root that browsing starts from: the user's desktop folder, or the home folder where there is none.
class PERU_API CDesktopFileObject : public CShellFileObject {
public:
    static P<CDesktopFileObject> get(); // throws CFileError

private:
    using CShellFileObject::CShellFileObject;
    template <class T, class... Args> friend P<T> peru::make(Args&&... args);
};

} // namespace peru::posix

// The desktop's view of files through GIO, including locations that are not on disk.
#pragma once

#include "peru/desktop/posix/GObjectPointer.h"
#include "peru/files/IFileObject.h"

namespace peru::posix {

// A location in the desktop's name space, such as a folder, "trash:///" or "network:///". For use by one
// thread.
class PERU_API CShellFolder : public CObject {
public:
    // Throws CFileError if the location does not exist or cannot contain items.
    static P<CShellFolder> bind(const P<IURI>& uri);

    P<IURI> getURI();
    // Its items. Throws CFileError.
    P<IFileObjectCursor> enumerate();
    // For one item, by its name. Both throw CFileError.
    P<IString> getItemName(const CStringArg& name);
    SFileAttributes getItemAttributes(const CStringArg& name);

private:
    explicit CShellFolder(TGObject<GFile> file) : m_file(std::move(file)) {}
    template <class T, class... Args> friend P<T> peru::make(Args&&... args);

    TGObject<GFile> m_file;
};

// An item as the desktop shows it. For use by one thread.
class PERU_API CShellFileObject : public CObject, public IFileObject {
public:
    // Throws CFileError if there is no such item.
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
    P<IString> getKind() override; // from its first bytes if the name does not suffice
    P<IFileObjectCursor> enumerate() override;

    P<IString> getKindDescription(); // in the user's language
    P<IString> getIconName();        // in the icon theme; empty if there is none

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

// The root of browsing: the user's desktop folder, or the home folder if there is none.
class PERU_API CDesktopFileObject : public CShellFileObject {
public:
    static P<CDesktopFileObject> get(); // throws CFileError

private:
    using CShellFileObject::CShellFileObject;
    template <class T, class... Args> friend P<T> peru::make(Args&&... args);
};

} // namespace peru::posix

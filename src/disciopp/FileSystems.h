// The file systems of drives and of the kinds of discs.
#pragma once

#include "disciopp/FileObjects.h"
#include "disciopp/IDrive.h"
#include "peru/files/ReadOnlyFileSystem.h"

namespace disciopp {

// Finds entries by walking from the root, one name at a time.
class CFileSystemBase : public peru::CReadOnlyFileSystem, public IFileSystem {
public:
    bool handles(const P<peru::IURI>& uri) override;
    P<peru::IFileObject> getFileObject(const P<peru::IURI>& uri) override;

protected:
    explicit CFileSystemBase(const P<peru::IURI>& root) : m_root(root) {}
    ~CFileSystemBase() override;

    const P<peru::IURI> m_root; // ends in a slash
};

class CDataDiscFileSystem : public CFileSystemBase {
public:
    CDataDiscFileSystem(const P<peru::IURI>& root, const P<IDisc>& disc)
        : CFileSystemBase(root), m_disc(disc) {}
    P<peru::IFileObject> getRoot() override;

private:
    P<IDisc> m_disc;
};

// One file for each track: "Track01.cda" and so on.
class CAudioCDDiscFileSystem : public CFileSystemBase {
public:
    CAudioCDDiscFileSystem(const P<peru::IURI>& root, const P<IAudioCDDisc>& disc)
        : CFileSystemBase(root), m_disc(disc) {}
    P<peru::IFileObject> getRoot() override;

private:
    P<IAudioCDDisc> m_disc;
};

class CEmptyDiscFileSystem : public CFileSystemBase {
public:
    explicit CEmptyDiscFileSystem(const P<peru::IURI>& root) : CFileSystemBase(root) {}
    P<peru::IFileObject> getRoot() override;
};

// There is no medium: everything is empty.
class CNoDiscFileSystem : public CFileSystemBase {
public:
    explicit CNoDiscFileSystem(const P<peru::IURI>& root) : CFileSystemBase(root) {}
    P<peru::IFileObject> getRoot() override;
};

// The root of a drive: whatever disc is in it when a function is called. Does not keep the drive alive.
class CDriveFileSystem : public CFileSystemBase {
public:
    CDriveFileSystem(const P<peru::IURI>& root, IDrive* drive) : CFileSystemBase(root), m_drive(drive) {}
    P<peru::IFileObject> getRoot() override;
    P<peru::IFileObject> getFileObject(const P<peru::IURI>& uri) override;

private:
    P<peru::IFileSystem> getCurrent();

    IDrive* m_drive;
};

// The name of a track as a file, counted from 1.
DISCIOPP_API std::string getTrackFileName(int32_t number);
// The number in such a name; 0 if it is another one.
DISCIOPP_API int32_t parseTrackFileName(std::string_view name);

// The path of an entry as the disc library takes it: with "\" between the names, without one at the end, and
// with `root`, without one at the start.
DISCIOPP_API P<peru::IString> toDiscPath(const P<peru::IURI>& uri, const P<peru::IURI>& root);

} // namespace disciopp

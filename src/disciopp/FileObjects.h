// Files and folders of drives and discs.
#pragma once

#include "disciopp/Discio.h"
#include "disciopp/IFileSystem.h"

#include <functional>
#include <string>
#include <vector>

namespace disciopp {

// A snapshot of one entry.
struct SEntry {
    std::string name; // UTF-8
    bool isFolder = false;
    int64_t size = 0;
    int64_t modified = -1; // seconds since 1970; -1: unknown
};
// Creates the objects in a folder when it is enumerated.
using Children = std::vector<P<IFileObject>>;
using ListChildren = std::function<Children()>;

class CFileObject : public CBase, public IFileObject {
public:
    CFileObject(const P<peru::IURI>& uri, const SEntry& entry, ListChildren list);

    P<peru::IURI> getURI() override { return m_uri; }
    P<peru::IString> getName() override;
    P<peru::IString> getDisplayName() override { return getName(); }
    bool isFile() override { return !m_entry.isFolder; }
    bool isFolder() override { return m_entry.isFolder; }
    int64_t getSize() override { return m_entry.size; }
    P<peru::CFileTimes> getTimes() override;
    peru::SFileAttributes getAttributes() override;
    P<peru::IString> getKind() override;
    P<peru::IFileObjectCursor> enumerate() override;

protected:
    ~CFileObject() override;

private:
    P<peru::IURI> m_uri;
    SEntry m_entry;
    ListChildren m_list;
};

// The root of a disc, the root of a drive, an entry of a data disc, and a track as a file.
class CDiscFileObject : public CFileObject {
    using CFileObject::CFileObject;
};
class CDriveFileObject : public CFileObject {
    using CFileObject::CFileObject;
};
class CDataDiscFileObject : public CFileObject {
    using CFileObject::CFileObject;
};
class CAudioCDDiscTrackFileObject : public CFileObject {
public:
    CAudioCDDiscTrackFileObject(const P<peru::IURI>& uri, const SEntry& entry,
                                const P<class IAudioCDDisc>& disc, int32_t segment);
    // The samples; closed. Throws CDISCIOPPException.
    Handle<DISCIO_PCMAudioStream> createStream();

private:
    ~CAudioCDDiscTrackFileObject() override;

    P<class IAudioCDDisc> m_disc;
    int32_t m_segment;
};

class CFileObjectCursor : public CBase, public IFileObjectCursor {
public:
    explicit CFileObjectCursor(Children children) : m_children(std::move(children)) {}

    bool next() override;
    P<peru::IFileObject> getFileObject() override { return current(); }
    void reset() override { m_next = 0; }

    P<peru::IURI> getURI() override { return current()->getURI(); }
    P<peru::IString> getName() override { return current()->getName(); }
    P<peru::IString> getDisplayName() override { return current()->getDisplayName(); }
    bool isFile() override { return current()->isFile(); }
    bool isFolder() override { return current()->isFolder(); }
    int64_t getSize() override { return current()->getSize(); }
    P<peru::CFileTimes> getTimes() override { return current()->getTimes(); }
    peru::SFileAttributes getAttributes() override { return current()->getAttributes(); }
    P<peru::IString> getKind() override { return current()->getKind(); }
    P<peru::IFileObjectCursor> enumerate() override { return current()->enumerate(); }

protected:
    ~CFileObjectCursor() override;

private:
    const P<IFileObject>& current() const; // throws peru::CInvalidObjectStateError

    Children m_children;
    size_t m_next = 0;
};

} // namespace disciopp

// A file or folder of any file system, and enumeration of a folder's children.
#pragma once

#include "peru/files/FileTimes.h"
#include "peru/uri/IURI.h"

namespace peru {

class IFileObjectCursor;

struct SFileAttributes {
    bool hidden = false;     // its name starts with "."
    bool readOnly = false;   // not writable for anybody, or not for this user
    bool link = false;       // it is a symbolic link; the other three describe its target
    bool executable = false; // an executable file
};

// A snapshot from when the object was created; later changes are not seen. For use by one thread. Links are
// followed unless stated otherwise.
class PERU_API IFileObject : public virtual IBase {
public:
    virtual P<IURI> getURI() = 0;            // ends in "/" for a folder
    virtual P<IString> getName() = 0;        // the last segment, byte for byte
    virtual P<IString> getDisplayName() = 0; // for display; valid text
    virtual bool isFile() = 0;
    virtual bool isFolder() = 0;
    virtual int64_t getSize() = 0; // in bytes; 0 if this is not a file
    virtual P<CFileTimes> getTimes() = 0;
    virtual SFileAttributes getAttributes() = 0;
    virtual P<IString> getKind() = 0; // the content type, such as "audio/x-wav" or "inode/directory"
    // The children in no particular order. Throws CFileError if this is not a folder or cannot be read.
    virtual P<IFileObjectCursor> enumerate() = 0;
};

// Starts before the first child. For use by one thread.
//   while (cursor->next()) use(cursor->getFileObject());
class PERU_API IFileObjectCursor : public virtual IBase {
public:
    virtual bool next() = 0; // false after the last child
    // The child under the cursor. Throws CInvalidObjectStateError if there is none.
    virtual P<IFileObject> getFileObject() = 0;
    virtual void reset() = 0; // back to before the first child
};

} // namespace peru

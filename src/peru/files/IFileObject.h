// A file or folder of any file system, and the walk over a folder's children.
#pragma once

#include "peru/files/FileTimes.h"
#include "peru/uri/IURI.h"

namespace peru {

class IFileObjectCursor;

struct SFileAttributes {
    bool hidden = false;     // its name starts with "."
    bool readOnly = false;   // nobody, or not this user, may write to it
    bool link = false;       // it is a link; the other three tell of what it leads to
    bool executable = false; // a file that may be started
};

// What was there when the object was made; it does not follow later changes. Belongs to one thread. Links
// are followed, except where told.
class PERU_API IFileObject : public virtual IBase {
public:
    virtual P<IURI> getURI() = 0;            // ends in "/" for a folder
    virtual P<IString> getName() = 0;        // the last segment, byte for byte
    virtual P<IString> getDisplayName() = 0; // for the eye; valid text
    virtual bool isFile() = 0;
    virtual bool isFolder() = 0;
    virtual int64_t getSize() = 0; // in bytes; 0 for what is no file
    virtual P<CFileTimes> getTimes() = 0;
    virtual SFileAttributes getAttributes() = 0;
    virtual P<IString> getKind() = 0; // the content type, such as "audio/x-wav" or "inode/directory"
    // The children in no particular order. Throws CFileError when this is no folder or cannot be read.
    virtual P<IFileObjectCursor> enumerate() = 0;
};

// Stands before the first child when made. Belongs to one thread.
//   while (cursor->next()) use(cursor->getFileObject());
class PERU_API IFileObjectCursor : public virtual IBase {
public:
    virtual bool next() = 0; // false behind the last child
    // The child under the cursor. Throws CInvalidObjectStateError when there is none.
    virtual P<IFileObject> getFileObject() = 0;
    virtual void reset() = 0; // before the first child again
};

} // namespace peru

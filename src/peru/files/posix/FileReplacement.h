// Replacement of a file's content on this platform.
#pragma once

#include "peru/Object.h"
#include "peru/files/IFileReplacement.h"
#include "peru/posix/PlatformFile.h"

#include <memory>
#include <string>

namespace peru::posix {

class CReplacementStream;

// The name of a temporary file. Deletes the file on destruction, also if the owner's constructor throws.
struct STemporaryName {
    STemporaryName() = default;
    STemporaryName(const STemporaryName&) = delete;
    ~STemporaryName();

    std::string path; // empty if there is no such file
};

// The content is written to an unnamed file in the folder of the old one or, if the file system does not
// support unnamed files, to a hidden one that this object deletes. A process that is killed while commit()
// renames may leave the complete new file under a hidden name.
//
// The new file takes over mode, access lists, extended attributes and, as far as the user may set them, group
// and owner; permissions that would apply to a different group are dropped. Its modification time is the time
// of writing. Of a file with several hard links only this name is replaced: the other names keep the old
// content, since changing them too would mean writing in place.
class CFileReplacement : public CObject, public IFileReplacement {
public:
    // The file need not exist; a dangling link creates its target. Throws CFileError, or
    // CFileAccessDeniedError if the user may not write the
    // file or its folder.
    explicit CFileReplacement(const P<IURI>& file);
    ~CFileReplacement() override;

    P<ISeekableIOStream> getStream() override;
    void copyFromOld(int64_t offset, int64_t size) override;
    void commit() override;

private:
    void openOld();
    void openNew();
    // All return 0 or an errno value.
    int openNamed(CFileHandle& file); // a hidden file that only the user can open; sets m_name
    int giveName();                   // links the unnamed file; sets m_name
    int copyToNamed();                // in place of giveName
    int finishContent();              // attributes and fsync
    int finish();

    P<IURI> m_uri;
    std::string m_target; // with links resolved
    std::string m_folder; // of the target, with a trailing "/"
    CFileHandle m_old;    // not open if the file does not exist
    CFileHandle m_new;
    STemporaryName m_name; // of the new file
    P<CReplacementStream> m_stream;
};

} // namespace peru::posix

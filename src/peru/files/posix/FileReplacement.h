// The new content of a file on this platform.
#pragma once

#include "peru/Object.h"
#include "peru/files/IFileReplacement.h"
#include "peru/posix/PlatformFile.h"

#include <memory>
#include <string>

namespace peru::posix {

class CReplacementStream;

// The name of a file that goes with this object, also when the constructor of its owner fails.
struct STemporaryName {
    STemporaryName() = default;
    STemporaryName(const STemporaryName&) = delete;
    ~STemporaryName();

    std::string path; // empty while there is no such file
};

// The content grows in a file without a name in the folder of the old one, or, where the file system has no
// such files, in a hidden one that goes with this object. A process that dies while commit() renames may
// leave the whole new file under a hidden name; at every other time nothing stays.
//
// What the new file takes over: mode, access lists, extended attributes, the group and the owner as far as
// this user may give them away; rights that would reach another group than before are dropped. Its time is
// that of the writing. A file with several names is replaced under this one only: writing through to the
// others would mean to write in place, and whoever wants the old content keeps it there.
class CFileReplacement : public CObject, public IFileReplacement {
public:
    // The file need not exist. Throws CFileError: CFileAccessDeniedError for a file or a folder that the user
    // may not write.
    explicit CFileReplacement(const P<IURI>& file);
    ~CFileReplacement() override;

    P<ISeekableIOStream> getStream() override;
    void copyFromOld(int64_t offset, int64_t size) override;
    void commit() override;

private:
    void openOld();
    void openNew();
    // Answer 0 or an errno value.
    int giveName(std::string& name);
    int finish();

    P<IURI> m_uri;
    std::string m_target; // where links lead to
    std::string m_folder; // of the target, with a trailing "/"
    CFileHandle m_old;    // not open when there is no such file
    CFileHandle m_new;
    STemporaryName m_name; // of the new file
    P<CReplacementStream> m_stream;
};

} // namespace peru::posix

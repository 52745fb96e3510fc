// The stream through which TagLib accesses a file.
#pragma once

#include "filetag/Api.h"
#include "filetag/posix/OpenedFile.h"
#include "filetag/taglib/PieceTable.h"
#include "peru/uri/IURI.h"

#include <tfilestream.h>

#include <memory>
#include <optional>
#include <string>

namespace filetag::taglib {

using peru::P;

// Reads from the file. What TagLib writes stays in memory until commit(), so the file on disk is never partly
// changed. TagLib calls only the operations of IOStream.
class FILETAG_API CTagLibIOStream : public TagLib::IOStream {
public:
    // Throws CFileError if the file cannot be read. With exclusive access no other tag is stored to the file
    // until the end of commit().
    explicit CTagLibIOStream(const P<peru::IURI>& file, posix::EAccess access = posix::EAccess::shared);
    ~CTagLibIOStream() override;

    // Writes the changes to disk. A change within one page of the file is written in place by a single call,
    // which cannot be torn; any other change makes a copy of the file, which then replaces it. Throws
    // CFileError and leaves the file unchanged on failure; posix::CFileChangedError if another program has
    // changed it since it was opened and, with `certain`, also if that cannot be ruled out.
    void commit(bool certain = false);

    TagLib::FileName name() const override;
    TagLib::ByteVector readBlock(unsigned long length) override;
    void writeBlock(const TagLib::ByteVector& data) override;
    void insert(const TagLib::ByteVector& data, unsigned long start, unsigned long replace) override;
    void removeBlock(unsigned long start, unsigned long length) override;
    bool readOnly() const override; // always false: missing permission is reported by commit()
    bool isOpen() const override;
    void seek(long offset, Position from) override;
    void clear() override;
    long tell() const override;
    long length() override;
    void truncate(long length) override;

private:
    struct SRange {
        int64_t start = 0;
        int64_t end = 0;
    };

    CPieceTable& change();
    std::string readOld(int64_t offset, int64_t size);
    // The range from the first to the last byte that differs from the old file. Requires equal lengths.
    SRange findDifference();
    std::string readNew(const SRange& range);
    void writePage(const SRange& range);
    void replaceFile();

    P<peru::IURI> m_uri;
    std::unique_ptr<posix::COpenedFile> m_opened;
    std::string m_path;
    TagLib::FileStream m_file;
    int64_t m_oldSize = 0;
    std::optional<CPieceTable> m_pieces; // set by the first change, since most files are only read
    int64_t m_position = 0;              // used once there are changes; before that the file's own
};

} // namespace filetag::taglib

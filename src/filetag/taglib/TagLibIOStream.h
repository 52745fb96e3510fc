// The file of a tag, as TagLib sees it.
#pragma once

#include "filetag/Api.h"
#include "filetag/taglib/PieceTable.h"
#include "peru/uri/IURI.h"

#include <tfilestream.h>

#include <filesystem>
#include <optional>
#include <string>

namespace filetag::taglib {

using peru::P;

// Reads from the file; what TagLib writes is kept in memory until commit(), so that the file on the disk
// never is half changed. Nothing but IOStream's own operations is TagLib's to call.
class FILETAG_API CTagLibIOStream : public TagLib::IOStream {
public:
    // Throws CFileError when the file cannot be read.
    explicit CTagLibIOStream(const P<peru::IURI>& file);
    ~CTagLibIOStream() override;

    // Brings the changes to the disk. A change within one page of the file is written in its place by one
    // call, which nothing can tear; others cost a copy of the file, which then takes its place. Throws
    // CFileError with the file as it was, also when another program has changed it since it was opened.
    void commit();

    TagLib::FileName name() const override;
    TagLib::ByteVector readBlock(unsigned long length) override;
    void writeBlock(const TagLib::ByteVector& data) override;
    void insert(const TagLib::ByteVector& data, unsigned long start, unsigned long replace) override;
    void removeBlock(unsigned long start, unsigned long length) override;
    bool readOnly() const override; // never: whether the user may write shows when it is done
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
    // What differs from the old file, from the first byte to the last; the content is as long as that.
    SRange findDifference();
    std::string readNew(const SRange& range);
    void checkUnchanged() const;
    void writePage(const SRange& range);
    void replaceFile();

    P<peru::IURI> m_uri;
    TagLib::FileStream m_file;
    int64_t m_oldSize = 0;
    std::filesystem::file_time_type m_oldTime; // of the last change
    std::optional<CPieceTable> m_pieces;       // from the first change on: most files are only read
    int64_t m_position = 0;                    // once there are changes; the file's own before
};

} // namespace filetag::taglib

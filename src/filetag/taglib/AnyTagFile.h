// A file of any format that TagLib knows, with all its fields and pictures.
#pragma once

#include "filetag/taglib/Pictures.h"
#include "filetag/taglib/TagLibIOStream.h"

#include <fileref.h>
#include <tpropertymap.h>

namespace filetag::taglib {

using TagLib::PropertyMap;

// Writing changes the file in memory; commit() writes it to disk. One thread at a time.
class CAnyTagFile {
public:
    // Throws CFileError. With exclusive access no other tag is stored to the file until the end of commit().
    explicit CAnyTagFile(const P<peru::IURI>& uri, posix::EAccess access = posix::EAccess::shared);

    // Names without a key are in unsupportedData().
    PropertyMap readFields() const;
    std::vector<SPicture> readPictures() const;

    // Replaces all fields and, if given, all pictures, and reads the result back, which shows what the format
    // does not hold.
    void write(const PropertyMap& fields, const std::vector<SPicture>* pictures);
    // write() must not be called afterwards. Throws posix::CFileChangedError if another program changed the
    // file.
    void commit();

private:
    void open();

    P<peru::IURI> m_uri;
    CTagLibIOStream m_stream;
    std::vector<TagLib::String> m_lostFrames; // that TagLib cannot keep
    TagLib::FileRef m_file;                   // before the stream in the order of destruction
};

} // namespace filetag::taglib

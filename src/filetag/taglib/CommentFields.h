// The fields of a Vorbis comment that TagLib does not keep.
#pragma once

#include <oggfile.h>
#include <tbytevector.h>
#include <xiphcomment.h>

namespace filetag::taglib {

// The field of pictures in a comment.
extern const char kPictureField[];

// The comment's bytes in an Ogg file, from the vendor's length on; empty if there are none.
TagLib::ByteVector readOggComment(TagLib::Ogg::File& file);

// Adds the fields of the comment that TagLib drops when it parses the bytes: pictures that it cannot decode,
// as they are, and texts that are not UTF-8, as code page 1252.
void addDroppedFields(TagLib::Ogg::XiphComment& comment, const TagLib::ByteVector& bytes);

} // namespace filetag::taglib

// The metadata blocks of a FLAC file, for what TagLib does not keep.
#pragma once

#include <flacfile.h>
#include <tbytevector.h>
#include <tiostream.h>

namespace filetag::taglib {

// TagLib drops picture blocks that it cannot parse. Gives them a reserved type in the stream, under which it
// keeps them; restorePictures() reverses that. Both leave other content alone and end at the start.
void hideUnreadablePictures(TagLib::IOStream& stream);
void restorePictures(TagLib::IOStream& stream);

// The Vorbis comment; empty if there is none.
TagLib::ByteVector readFlacComment(TagLib::IOStream& stream);

// The length field of a block has 24 bits. TagLib would write a truncated length for a longer one, and
// readers would continue in the middle of it.
bool fitsFlacBlock(unsigned int size);
bool fitsFlacBlocks(TagLib::FLAC::File& file);

// File::save() loses fields of a comment that is not in the file yet: dates and track numbers that are not
// numbers.
bool saveFlac(TagLib::FLAC::File& file);

} // namespace filetag::taglib

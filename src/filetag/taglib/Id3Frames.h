// The frames of an ID3v2 tag as they are in the file, including those that TagLib does not parse.
#pragma once

#include "peru/uri/IURI.h"

#include <id3v2tag.h>
#include <tbytevector.h>
#include <tiostream.h>
#include <tstring.h>

#include <vector>

namespace filetag::taglib {

struct SId3Frame {
    TagLib::ByteVector id;   // of version 2.4
    TagLib::ByteVector body; // neither unsynchronised nor compressed

    TagLib::ByteVector render() const; // with its header of version 2.4
};

struct SId3Tag {
    unsigned int version = 0; // 2, 3 or 4; 0 if the file does not start with a tag
    std::vector<SId3Frame> frames;
    // Names of frames that version 2.4 cannot hold: encrypted ones, and some of version 2.2.
    std::vector<TagLib::String> unsupported;
    bool regular = true;   // TagLib reads all frames of it
    unsigned int size = 0; // in the file, with header and padding
};

// Reads the tag at the start of the stream. Continues behind empty frames, cuts one that is too long, adds
// missing byte order marks, and converts dates, genres and names of older versions.
SId3Tag readId3Tag(TagLib::IOStream& stream);

// Reads the tag and, if TagLib would lose a part of it, replaces it in the stream by one of version 2.4 with
// the same frames. Ends at the start of the stream.
SId3Tag prepareId3Tag(TagLib::IOStream& stream);

// Replaces frames that TagLib would render differently, and ones that it did not parse, by their bytes.
void keepForeignFrames(TagLib::ID3v2::Tag& tag, const SId3Tag& source);

// The id of the first frame of `before` that `after` does not have in the same form; empty if there is none.
// Frames whose ids are in `edited` are not compared.
TagLib::String findLostFrame(const SId3Tag& before, const SId3Tag& after,
                             const std::vector<TagLib::ByteVector>& edited);

// Throws CFileError.
[[noreturn]] void failLostFrame(const TagLib::String& id, const peru::P<peru::IURI>& file);

} // namespace filetag::taglib

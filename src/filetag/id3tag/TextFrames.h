// The fields in the frames of an ID3v2 tag.
#pragma once

#include "filetag/taglib/TagLibTag.h"

#include <id3v2tag.h>
#include <tbytevector.h>

#include <map>
#include <vector>

namespace filetag::id3tag {

TagLib::String readTextFrame(const TagLib::ID3v2::Tag& tag, taglib::EField field);
// The empty text removes the field.
void writeTextFrame(TagLib::ID3v2::Tag& tag, taglib::EField field, const TagLib::String& text);
// The frames that writeTextFrame() may change.
std::vector<TagLib::ByteVector> getTextFrameIds(taglib::EField field);

// The bytes of a tag with these texts, as version 2.4. Returns the same bytes if they are not a tag, have
// these texts already, or contain a frame that would be lost.
TagLib::ByteVector changeTexts(const TagLib::ByteVector& bytes,
                               const std::map<taglib::EField, TagLib::String>& texts);

} // namespace filetag::id3tag

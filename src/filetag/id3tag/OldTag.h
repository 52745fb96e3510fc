// The fields of an ID3v1 tag as texts.
#pragma once

#include "filetag/taglib/TagLibTag.h"

#include <id3v1tag.h>

namespace filetag::id3tag {

// Year and track number are numbers there: 0 reads as the empty text, and of a text its leading digits are
// written. Texts are cut and Latin-1; a field that the tag does not have is empty.
TagLib::String readOldField(const TagLib::ID3v1::Tag& tag, taglib::EField field);
void writeOldField(TagLib::ID3v1::Tag& tag, taglib::EField field, const TagLib::String& text);

} // namespace filetag::id3tag

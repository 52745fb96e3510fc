// The fields of an ID3v1 tag as texts.
#pragma once

#include "filetag/taglib/TagLibTag.h"

#include <id3v1tag.h>

namespace filetag::id3tag {

// ID3v1 stores year and track number as numbers: 0 reads as the empty text, and only the leading digits of a
// text are written. Texts are Latin-1 and are truncated; a field that ID3v1 does not have reads as empty.
TagLib::String readOldField(const TagLib::ID3v1::Tag& tag, taglib::EField field);
void writeOldField(TagLib::ID3v1::Tag& tag, taglib::EField field, const TagLib::String& text);

} // namespace filetag::id3tag

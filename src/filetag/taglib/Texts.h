// Conversions between peru and TagLib types.
#pragma once

#include "peru/MemoryManager.h"
#include "peru/strings/String.h"

#include <tbytevector.h>
#include <tstring.h>

namespace filetag::taglib {

using peru::P;

// TagLib stores UTF-16 units in its wide characters, whatever their width, so a character outside the basic
// multilingual plane is passed as a surrogate pair.
TagLib::String toTagText(const peru::CStringArg& text);
P<peru::IString> fromTagText(const TagLib::String& text);

TagLib::ByteVector toTagBytes(const P<peru::CMemoryBlock>& block); // an empty handle gives an empty vector
P<peru::CMemoryBlock> fromTagBytes(const TagLib::ByteVector& bytes);

} // namespace filetag::taglib

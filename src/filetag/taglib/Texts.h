// What crosses between this program and TagLib.
#pragma once

#include "peru/MemoryManager.h"
#include "peru/strings/String.h"

#include <tbytevector.h>
#include <tstring.h>

namespace filetag::taglib {

using peru::P;

// TagLib keeps UTF-16 units in its wide characters, whatever their width, so a character outside the first
// plane crosses as its two surrogates.
TagLib::String toTagText(const peru::CStringArg& text);
P<peru::IString> fromTagText(const TagLib::String& text);

TagLib::ByteVector toTagBytes(const P<peru::CMemoryBlock>& block); // an empty handle is an empty block
P<peru::CMemoryBlock> fromTagBytes(const TagLib::ByteVector& bytes);

} // namespace filetag::taglib

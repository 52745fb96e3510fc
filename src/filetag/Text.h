// Between texts and the bytes that stand for them in files.
#pragma once

#include "filetag/Api.h"
#include "peru/strings/String.h"

#include <string_view>

namespace filetag {

using peru::P;

// The text of UTF-8, or of bytes that are none as Western Windows programs write them (code page 1252). A
// UTF-16 string, which holds every character that UTF-8 has: the foundation's own UTF-8 reads emoji and some
// scripts as malformed.
FILETAG_API P<peru::IString> readNarrowText(std::string_view bytes);

} // namespace filetag

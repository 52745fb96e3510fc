// Decodes the narrow texts found in files.
#pragma once

#include "filetag/Api.h"
#include "peru/strings/String.h"

#include <string_view>

namespace filetag {

using peru::P;

// Decodes UTF-8; bytes that are not valid UTF-8 are decoded as code page 1252, which Western Windows programs
// write. Returns a UTF-16 string because it can hold every character: the UTF-8 decoder of peru rejects emoji
// and some scripts as malformed.
FILETAG_API P<peru::IString> readNarrowText(std::string_view bytes);

} // namespace filetag

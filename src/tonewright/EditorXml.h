// Reads an audio editor's arrangement.
#pragma once

#include "tonewright/Track.h"

#include <vector>

namespace tonewright {

// Returns the tracks in document order; none if the document has no "Tracks" element. Unknown elements are
// ignored; missing or empty ones take their defaults. Throws CParseError for malformed XML and for invalid
// numbers or times beyond 4000000 seconds, CURIFormatError for invalid URIs.
std::vector<P<CTrack>> readEditorXml(const peru::CStringArg& text);

} // namespace tonewright

// Reads the arrangement that an audio editor describes.
#pragma once

#include "tonewright/Track.h"

#include <vector>

namespace tonewright {

// The tracks in the order of the text; none where the document has no element "Tracks". Elements that are
// unknown are skipped, those that are missing or empty take their defaults. Throws CParseError for a text
// that is no XML and for numbers that are none, CURIFormatError.
std::vector<P<CTrack>> readEditorXml(const peru::CStringArg& text);

} // namespace tonewright

// A picture of a FLAC file.
#pragma once

#include "filetag/flactag/FLACTag.h"
#include "filetag/taglib/CoverArtOf.h"

namespace filetag::flactag {

class CCoverArt : public taglib::TCoverArtOf<CFLACTag, TagLib::FLAC::Picture> {
public:
    using TCoverArtOf::TCoverArtOf;
};

} // namespace filetag::flactag

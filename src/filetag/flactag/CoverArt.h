// A picture of a FLAC file.
#pragma once

#include "filetag/flactag/FLACTag.h"
#include "filetag/taglib/CoverArtOf.h"

namespace filetag::flactag {

class CCoverArt : public taglib::TCoverArtOf<CFLACTag, TagLib::FLAC::Picture> {
public:
    using TCoverArtOf::TCoverArtOf;

protected:
    bool isHeld() const override { return getTag()->holds(getPicture()); }
};

} // namespace filetag::flactag

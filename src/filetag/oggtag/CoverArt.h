// A picture of an Ogg Vorbis file.
#pragma once

#include "filetag/oggtag/OGGTag.h"
#include "filetag/taglib/CoverArtOf.h"

namespace filetag::oggtag {

class CCoverArt : public taglib::TCoverArtOf<COGGTag, TagLib::FLAC::Picture> {
public:
    using TCoverArtOf::TCoverArtOf;

protected:
    bool isHeld() const override { return getTag()->holds(getPicture()); }
};

} // namespace filetag::oggtag

// A picture of an MP3 file.
#pragma once

#include "filetag/id3tag/ID3Tag.h"
#include "filetag/taglib/CoverArtOf.h"

namespace filetag::id3tag {

class CCoverArt : public taglib::TCoverArtOf<CID3Tag, TagLib::ID3v2::AttachedPictureFrame> {
public:
    using TCoverArtOf::TCoverArtOf;

protected:
    bool isHeld() const override { return getTag()->holds(getPicture()); }
};

} // namespace filetag::id3tag

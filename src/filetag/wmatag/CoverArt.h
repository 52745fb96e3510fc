// A picture of an ASF file.
#pragma once

#include "filetag/taglib/CoverArtOf.h"
#include "filetag/wmatag/WMATag.h"

#include <asfpicture.h>

namespace filetag::wmatag {

class CCoverArt : public taglib::TCoverArtOf<CWMATag, TagLib::ASF::Picture> {
public:
    CCoverArt(const P<const CWMATag>& tag, const TagLib::ASF::Picture& picture)
        : TCoverArtOf(tag, &m_shared), m_shared(picture) {}

private:
    TagLib::ASF::Picture m_shared;
};

} // namespace filetag::wmatag

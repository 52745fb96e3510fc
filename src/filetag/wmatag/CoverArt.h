// A picture of an ASF file.
#pragma once

#include "filetag/taglib/CoverArtOf.h"
#include "filetag/wmatag/WMATag.h"

#include <asfpicture.h>

namespace filetag::wmatag {

class CCoverArt : public taglib::TCoverArtOf<CWMATag, TagLib::ASF::Picture> {
public:
    CCoverArt(const P<const CWMATag>& tag, const TagLib::ASF::Picture& picture, uint32_t id)
        : TCoverArtOf(tag, &m_shared), m_shared(picture), m_id(id) {}

protected:
    bool isHeld() const override { return getTag()->holdsPicture(m_id); }

private:
    TagLib::ASF::Picture m_shared; // its data is that of the tag's attribute
    uint32_t m_id;
};

} // namespace filetag::wmatag

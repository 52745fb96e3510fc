// The fields of a Vorbis comment, used by FLAC and Ogg.
#pragma once

#include "filetag/taglib/TagLibTag.h"

#include <xiphcomment.h>

namespace filetag::taglib {

class CXiphTag : public CTagLibTag {
protected:
    using CTagLibTag::CTagLibTag;

    void dropTags() override { m_comment = nullptr; }
    TagLib::String readField(EField field) const override;
    void writeField(EField field, const TagLib::String& text) override;

    TagLib::Ogg::XiphComment* m_comment = nullptr; // of the open file; null if it has none
};

} // namespace filetag::taglib

// The fields of a Vorbis comment, used by FLAC and Ogg.
#pragma once

#include "filetag/taglib/TagLibTag.h"

#include <flacpicture.h>
#include <xiphcomment.h>

#include <memory>
#include <vector>

namespace filetag::taglib {

class CXiphTag : public CTagLibTag {
protected:
    using CTagLibTag::CTagLibTag;

    void dropTags() override;
    TagLib::String readField(EField field) const override;
    void writeField(EField field, const TagLib::String& text) override;

    TagLib::Ogg::XiphComment* m_comment = nullptr; // of the open file; null if it has none
    // Kept until close(), so that no new picture gets the address that identifies a removed one.
    std::vector<std::unique_ptr<TagLib::FLAC::Picture>> m_removedPictures;
};

} // namespace filetag::taglib

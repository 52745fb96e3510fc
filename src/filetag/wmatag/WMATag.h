// The tag of an ASF file, such as WMA.
#pragma once

#include "filetag/taglib/TagLibTag.h"

#include <asffile.h>

#include <vector>

namespace filetag::wmatag {

class FILETAG_API CWMATag : public taglib::CTagLibTag {
public:
    explicit CWMATag(const P<peru::IURI>& file);
    ~CWMATag() override;

    P<peru::IString> getTagType() const override;
    int32_t getCoverArtCount() const override;
    P<ICoverArt> getCoverArt(int32_t index) const override;
    void addCoverArt(const P<peru::CMemoryBlock>& data, const peru::CStringArg& mimeType,
                     EPictureType type) override;
    void removeCoverArt(int32_t index) override;

    bool holdsPicture(uint32_t id) const;

protected:
    std::unique_ptr<TagLib::File> openFile(TagLib::IOStream& stream) override;
    void dropTags() override;
    TagLib::String readField(taglib::EField field) const override;
    void writeField(taglib::EField field, const TagLib::String& text) override;
    bool save(TagLib::File& file, TagLib::IOStream& stream) override;

private:
    TagLib::String readOwnField(taglib::EField field) const;

    TagLib::ASF::Tag* m_tag = nullptr;  // of the open file
    std::vector<uint32_t> m_pictureIds; // one for each picture, in order
    uint32_t m_lastPictureId = 0;
};

} // namespace filetag::wmatag

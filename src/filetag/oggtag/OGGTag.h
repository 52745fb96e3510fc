// The tag of an Ogg Vorbis file. Pictures are stored in the comment as METADATA_BLOCK_PICTURE fields.
#pragma once

#include "filetag/taglib/XiphTag.h"

#include <vorbisfile.h>

namespace filetag::oggtag {

class FILETAG_API COGGTag : public taglib::CXiphTag {
public:
    explicit COGGTag(const P<peru::IURI>& file);
    ~COGGTag() override;

    P<peru::IString> getTagType() const override;
    int32_t getCoverArtCount() const override;
    P<ICoverArt> getCoverArt(int32_t index) const override;
    void addCoverArt(const P<peru::CMemoryBlock>& data, const peru::CStringArg& mimeType,
                     EPictureType type) override;
    void removeCoverArt(int32_t index) override;

    bool holds(const TagLib::FLAC::Picture* picture) const; // belongs to the open tag

protected:
    std::unique_ptr<TagLib::File> openFile(TagLib::IOStream& stream) override;
    void dropTags() override;

private:
    TagLib::List<TagLib::FLAC::Picture*> getPictures() const;
    TagLib::FLAC::Picture* getPicture(int32_t index) const; // null if out of range
};

} // namespace filetag::oggtag

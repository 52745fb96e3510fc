// The tag of a FLAC file: its Vorbis comment and its picture blocks.
#pragma once

#include "filetag/taglib/XiphTag.h"

#include <flacfile.h>

namespace filetag::flactag {

class FILETAG_API CFLACTag : public taglib::CXiphTag {
public:
    explicit CFLACTag(const P<peru::IURI>& file);
    ~CFLACTag() override;

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
    bool save(TagLib::File& file, TagLib::IOStream& stream) override;

private:
    TagLib::List<TagLib::FLAC::Picture*> getPictures() const;
    TagLib::FLAC::Picture* getPicture(int32_t index) const; // null if out of range

    TagLib::FLAC::File* m_flac = nullptr; // the open file
};

} // namespace filetag::flactag

// The tag of an MP3 file: ID3v2, plus ID3v1 for old players.
#pragma once

#include "filetag/taglib/Id3Frames.h"
#include "filetag/taglib/TagLibTag.h"

#include <attachedpictureframe.h>
#include <mpegfile.h>

#include <vector>

namespace filetag::id3tag {

// Reads the ID3v2 tag, and the ID3v1 and APE tags for fields missing there. Writes the first two, ID3v2 as
// version 2.4, and updates the texts that an APE tag has. Comments with a description are data of other
// programs.
class FILETAG_API CID3Tag : public taglib::CTagLibTag {
public:
    explicit CID3Tag(const P<peru::IURI>& file);
    ~CID3Tag() override;

    P<peru::IString> getTagType() const override;
    int32_t getCoverArtCount() const override;
    P<ICoverArt> getCoverArt(int32_t index) const override;
    // Supports front and back cover only; any other type is stored as kOtherPicture.
    void addCoverArt(const P<peru::CMemoryBlock>& data, const peru::CStringArg& mimeType,
                     EPictureType type) override;
    void removeCoverArt(int32_t index) override;

    bool holds(const TagLib::ID3v2::AttachedPictureFrame* picture) const; // belongs to the open tag

protected:
    std::unique_ptr<TagLib::File> openFile(TagLib::IOStream& stream) override;
    void dropTags() override;
    TagLib::String readField(taglib::EField field) const override;
    void writeField(taglib::EField field, const TagLib::String& text) override;
    bool save(TagLib::File& file, TagLib::IOStream& stream) override;

private:
    std::vector<TagLib::ID3v2::AttachedPictureFrame*> getPictures() const;
    TagLib::ID3v2::AttachedPictureFrame* getPicture(int32_t index) const; // null if out of range
    void createTag();
    TagLib::String readFrame(taglib::EField field) const;
    void writeFrame(taglib::EField field, const TagLib::String& text);

    taglib::SId3Tag m_source; // the ID3v2 tag in the file
    mutable std::vector<TagLib::ByteVector> m_editedIds;
    TagLib::MPEG::File* m_mpeg = nullptr; // the open file
    TagLib::ID3v2::Tag* m_tag = nullptr;  // null if the file has none, until something is written
    TagLib::ID3v1::Tag* m_oldTag = nullptr;
    TagLib::APE::Tag* m_apeTag = nullptr; // null if the file has none
    // Kept until close(), so that no new picture gets the address that identifies a removed one.
    std::vector<std::unique_ptr<TagLib::ID3v2::AttachedPictureFrame>> m_removedPictures;
};

} // namespace filetag::id3tag

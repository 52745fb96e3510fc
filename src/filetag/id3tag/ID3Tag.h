// The tag of an MP3 file: ID3v2, and ID3v1 beside it for old players.
#pragma once

#include "filetag/taglib/TagLibTag.h"

#include <attachedpictureframe.h>
#include <commentsframe.h>
#include <mpegfile.h>

#include <vector>

namespace filetag::id3tag {

// Reads the ID3v2 tag, and the ID3v1 tag where that has nothing. Both are written, the first as version 2.4.
class FILETAG_API CID3Tag : public taglib::CTagLibTag {
public:
    explicit CID3Tag(const P<peru::IURI>& file);
    ~CID3Tag() override;

    P<peru::IString> getTagType() const override;
    int32_t getCoverArtCount() const override;
    P<ICoverArt> getCoverArt(int32_t index) const override;
    // Knows front and back cover; everything else is entered as other.
    void addCoverArt(const P<peru::CMemoryBlock>& data, const peru::CStringArg& mimeType,
                     EPictureType type) override;
    void removeCoverArt(int32_t index) override;

    bool holds(const TagLib::ID3v2::AttachedPictureFrame* picture) const; // is one of the open tag's

protected:
    std::unique_ptr<TagLib::File> openFile(TagLib::IOStream& stream) override;
    void dropTags() override;
    TagLib::String readField(taglib::EField field) const override;
    void writeField(taglib::EField field, const TagLib::String& text) override;
    bool save(TagLib::File& file) override;

private:
    std::vector<TagLib::ID3v2::AttachedPictureFrame*> getPictures() const;
    TagLib::ID3v2::AttachedPictureFrame* getPicture(int32_t index) const; // null outside the list
    void createTag();
    TagLib::ID3v2::CommentsFrame* findComment() const; // the one that users mean; null without one
    TagLib::String readComment() const;
    TagLib::String readFrame(taglib::EField field) const;
    void writeFrame(taglib::EField field, const TagLib::String& text);
    void writeComment(const TagLib::String& text);

    TagLib::MPEG::File* m_mpeg = nullptr; // the open file
    TagLib::ID3v2::Tag* m_tag = nullptr;  // empty for a file without one, until there is something to write
    TagLib::ID3v1::Tag* m_oldTag = nullptr;
};

} // namespace filetag::id3tag

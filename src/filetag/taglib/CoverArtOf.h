// Implements ICoverArt on top of TagLib's picture classes, which differ only slightly.
#pragma once

#include "filetag/ICoverArt.h"
#include "filetag/PictureTypes.h"
#include "filetag/taglib/Texts.h"
#include "peru/Object.h"

#include <flacpicture.h>

namespace filetag::taglib {

template <class Picture> TagLib::ByteVector getPictureBytes(const Picture& picture) {
    return picture.picture();
}
template <class Picture> void setPictureBytes(Picture& picture, const TagLib::ByteVector& bytes) {
    picture.setPicture(bytes);
}
inline TagLib::ByteVector getPictureBytes(const TagLib::FLAC::Picture& picture) {
    return picture.data();
}
inline void setPictureBytes(TagLib::FLAC::Picture& picture, const TagLib::ByteVector& bytes) {
    picture.setData(bytes);
    // Zero means unknown; the old picture's dimensions would be wrong.
    picture.setWidth(0);
    picture.setHeight(0);
    picture.setColorDepth(0);
    picture.setNumColors(0);
}

template <class Picture> void fillPicture(Picture& picture, const P<peru::CMemoryBlock>& data,
                                          const peru::CStringArg& mimeType, EPictureType type) {
    setPictureBytes(picture, toTagBytes(data));
    picture.setMimeType(toTagText(mimeType));
    picture.setType(static_cast<typename Picture::Type>(toFileNumber(type)));
}

// Keeps the tag object alive. A picture that was removed, or whose tag was closed, reads as empty.
template <class Tag, class Picture> class TCoverArtOf : public peru::CObject, public ICoverArt {
public:
    TCoverArtOf(const P<const Tag>& tag, Picture* picture)
        : m_tag(tag), m_picture(picture), m_generation(tag->getGeneration()) {}

    P<peru::CMemoryBlock> getData() const override {
        return fromTagBytes(isThere() ? getPictureBytes(*m_picture) : TagLib::ByteVector());
    }
    void setData(const P<peru::CMemoryBlock>& data) override {
        if (!isThere()) return;
        setPictureBytes(*m_picture, toTagBytes(data));
        m_tag->markChanged();
    }
    EPictureType getPictureType() const override {
        return isThere() ? fromFileNumber(m_picture->type()) : kOtherPicture;
    }
    void setPictureType(EPictureType type) override {
        if (!isThere()) return;
        m_picture->setType(static_cast<typename Picture::Type>(toFileNumber(type)));
        m_tag->markChanged();
    }
    P<peru::IString> getMimeType() const override {
        return isThere() ? fromTagText(m_picture->mimeType()) : peru::CString::empty();
    }
    void setMimeType(const peru::CStringArg& type) override {
        if (!isThere()) return;
        m_picture->setMimeType(toTagText(type));
        m_tag->markChanged();
    }
    P<peru::IString> getDescription() const override {
        return isThere() ? fromTagText(m_picture->description()) : peru::CString::empty();
    }

protected:
    Picture* getPicture() const { return m_picture; }
    const P<const Tag>& getTag() const { return m_tag; }
    virtual bool isHeld() const = 0; // the picture has not been removed from the open tag

    bool isThere() const { return m_generation == m_tag->getGeneration() && isHeld(); }

private:
    P<const Tag> m_tag;
    Picture* m_picture;
    uint32_t m_generation;
};

} // namespace filetag::taglib

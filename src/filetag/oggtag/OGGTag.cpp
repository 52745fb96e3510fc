#include "filetag/oggtag/OGGTag.h"

#include "filetag/oggtag/CoverArt.h"
#include "filetag/taglib/CommentFields.h"

namespace filetag::oggtag {

using namespace peru;

COGGTag::COGGTag(const P<IURI>& file) : CXiphTag(file) {}

COGGTag::~COGGTag() {
    close();
}

std::unique_ptr<TagLib::File> COGGTag::openFile(TagLib::IOStream& stream) {
    auto file = std::make_unique<TagLib::Ogg::Vorbis::File>(&stream);
    if (!file->isValid()) return nullptr;
    m_comment = file->tag();
    taglib::addDroppedFields(*m_comment, taglib::readOggComment(*file));
    return file;
}

void COGGTag::dropTags() {
    CXiphTag::dropTags();
}

P<IString> COGGTag::getTagType() const {
    return m_comment ? newString("Vorbis comment") : CString::empty();
}

TagLib::List<TagLib::FLAC::Picture*> COGGTag::getPictures() const {
    return m_comment ? m_comment->pictureList() : TagLib::List<TagLib::FLAC::Picture*>();
}

TagLib::FLAC::Picture* COGGTag::getPicture(int32_t index) const {
    const TagLib::List<TagLib::FLAC::Picture*> pictures = getPictures();
    return index >= 0 && static_cast<uint32_t>(index) < pictures.size()
               ? pictures[static_cast<unsigned int>(index)]
               : nullptr;
}

bool COGGTag::holds(const TagLib::FLAC::Picture* picture) const {
    return getPictures().contains(const_cast<TagLib::FLAC::Picture*>(picture));
}

int32_t COGGTag::getCoverArtCount() const {
    return static_cast<int32_t>(getPictures().size());
}

P<ICoverArt> COGGTag::getCoverArt(int32_t index) const {
    TagLib::FLAC::Picture* picture = getPicture(index);
    return picture ? P<ICoverArt>(make<CCoverArt>(P<const COGGTag>::share(this), picture)) : nullptr;
}

void COGGTag::addCoverArt(const P<CMemoryBlock>& data, const CStringArg& mimeType, EPictureType type) {
    if (!m_comment) return;
    auto picture = std::make_unique<TagLib::FLAC::Picture>();
    taglib::fillPicture(*picture, data, mimeType, type);
    m_comment->addPicture(picture.release());
    markChanged();
}

void COGGTag::removeCoverArt(int32_t index) {
    TagLib::FLAC::Picture* picture = getPicture(index);
    if (!picture) return;
    m_comment->removePicture(picture, false);
    m_removedPictures.emplace_back(picture);
    markChanged();
}

} // namespace filetag::oggtag

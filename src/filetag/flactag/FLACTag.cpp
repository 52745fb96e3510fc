#include "filetag/flactag/FLACTag.h"

#include "filetag/flactag/CoverArt.h"
#include "filetag/taglib/CommentFields.h"
#include "filetag/taglib/FlacBlocks.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

#include <id3v2framefactory.h>

namespace filetag::flactag {

using namespace peru;

CFLACTag::CFLACTag(const P<IURI>& file) : CXiphTag(file) {}

CFLACTag::~CFLACTag() {
    close();
}

std::unique_ptr<TagLib::File> CFLACTag::openFile(TagLib::IOStream& stream) {
    taglib::hideUnreadablePictures(stream);
    auto file = std::make_unique<TagLib::FLAC::File>(&stream, TagLib::ID3v2::FrameFactory::instance());
    if (!file->isValid()) return nullptr;
    m_flac = file.get();
    m_comment = file->xiphComment(false);
    if (m_comment) taglib::addDroppedFields(*m_comment, taglib::readFlacComment(stream));
    return file;
}

void CFLACTag::dropTags() {
    CXiphTag::dropTags();
    m_flac = nullptr;
}

bool CFLACTag::save(TagLib::File& file, TagLib::IOStream& stream) {
    if (!taglib::fitsFlacBlocks(*m_flac))
        throw CFileError(localize("filetag.CFLACTag.TooLong", "The tag is too long for the file '%FILE%'.",
                                  {{"%FILE%", getShownName(getURI())}}),
                         getURI());
    if (!taglib::saveFlac(*m_flac)) return false;
    taglib::restorePictures(stream);
    return true;
}

P<IString> CFLACTag::getTagType() const {
    return m_flac && m_flac->hasXiphComment() ? newString("Vorbis comment") : CString::empty();
}

TagLib::List<TagLib::FLAC::Picture*> CFLACTag::getPictures() const {
    return m_flac ? m_flac->pictureList() : TagLib::List<TagLib::FLAC::Picture*>();
}

TagLib::FLAC::Picture* CFLACTag::getPicture(int32_t index) const {
    const TagLib::List<TagLib::FLAC::Picture*> pictures = getPictures();
    return index >= 0 && static_cast<uint32_t>(index) < pictures.size()
               ? pictures[static_cast<unsigned int>(index)]
               : nullptr;
}

bool CFLACTag::holds(const TagLib::FLAC::Picture* picture) const {
    return getPictures().contains(const_cast<TagLib::FLAC::Picture*>(picture));
}

int32_t CFLACTag::getCoverArtCount() const {
    return static_cast<int32_t>(getPictures().size());
}

P<ICoverArt> CFLACTag::getCoverArt(int32_t index) const {
    TagLib::FLAC::Picture* picture = getPicture(index);
    return picture ? P<ICoverArt>(make<CCoverArt>(P<const CFLACTag>::share(this), picture)) : nullptr;
}

void CFLACTag::addCoverArt(const P<CMemoryBlock>& data, const CStringArg& mimeType, EPictureType type) {
    if (!m_flac) return;
    auto picture = std::make_unique<TagLib::FLAC::Picture>();
    taglib::fillPicture(*picture, data, mimeType, type);
    m_flac->addPicture(picture.release());
    markChanged();
}

void CFLACTag::removeCoverArt(int32_t index) {
    TagLib::FLAC::Picture* picture = getPicture(index);
    if (!picture) return;
    m_flac->removePicture(picture, false);
    m_removedPictures.emplace_back(picture);
    markChanged();
}

} // namespace filetag::flactag

#include "filetag/flactag/FLACTag.h"

#include "filetag/flactag/CoverArt.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

#include <id3v2framefactory.h>

#include <algorithm>

namespace filetag::flactag {

using namespace peru;

namespace {

// The block length field has 24 bits.
constexpr unsigned int kLargestBlock = 0xffffff;

} // namespace

CFLACTag::CFLACTag(const P<IURI>& file) : CXiphTag(file) {}

CFLACTag::~CFLACTag() {
    close();
}

std::unique_ptr<TagLib::File> CFLACTag::openFile(TagLib::IOStream& stream) {
    auto file = std::make_unique<TagLib::FLAC::File>(&stream, TagLib::ID3v2::FrameFactory::instance());
    if (!file->isValid()) return nullptr;
    m_flac = file.get();
    m_comment = file->xiphComment(false);
    return file;
}

void CFLACTag::dropTags() {
    CXiphTag::dropTags();
    m_flac = nullptr;
}

// TagLib would write a truncated length for a longer block, and readers would continue in the middle of it.
bool CFLACTag::save(TagLib::File& file) {
    unsigned int largest = m_comment ? m_comment->render(false).size() : 0;
    for (const TagLib::FLAC::Picture* picture : getPictures())
        largest = std::max(largest, picture->render().size());
    if (largest > kLargestBlock)
        throw CFileError(localize("filetag.CFLACTag.TooLong", "The tag is too long for the file '%FILE%'.",
                                  {{"%FILE%", getShownName(getURI())}}),
                         getURI());
    return file.save();
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
    m_flac->removePicture(picture);
    markChanged();
}

} // namespace filetag::flactag

#include "filetag/id3tag/ID3Tag.h"

#include "filetag/id3tag/CoverArt.h"
#include "filetag/id3tag/OldTag.h"
#include "filetag/id3tag/TextFrames.h"

#include <apetag.h>
#include <id3v1tag.h>
#include <id3v2framefactory.h>
#include <id3v2header.h>
#include <id3v2tag.h>

#include <algorithm>

namespace filetag::id3tag {

using namespace peru;
using taglib::EField;
using TagLib::ID3v2::AttachedPictureFrame;

namespace {

constexpr EField kFields[] = {EField::title,       EField::artist, EField::album, EField::albumArtist,
                              EField::trackNumber, EField::year,   EField::genre, EField::comment};

const char* getApeKey(EField field) {
    switch (field) {
    case EField::title:
        return "TITLE";
    case EField::artist:
        return "ARTIST";
    case EField::album:
        return "ALBUM";
    case EField::albumArtist:
        return "ALBUM ARTIST";
    case EField::trackNumber:
        return "TRACK";
    case EField::year:
        return "YEAR";
    case EField::genre:
        return "GENRE";
    case EField::comment:
        return "COMMENT";
    }
    return "";
}

TagLib::String readApeField(const TagLib::APE::Tag& tag, EField field) {
    const auto& items = tag.itemListMap();
    const auto found = items.find(getApeKey(field));
    if (found == items.end() || found->second.type() != TagLib::APE::Item::Text) return {};
    const TagLib::StringList values = found->second.values();
    return values.isEmpty() ? TagLib::String() : values.front();
}

} // namespace

CID3Tag::CID3Tag(const P<IURI>& file) : CTagLibTag(file) {}

CID3Tag::~CID3Tag() {
    close();
}

std::unique_ptr<TagLib::File> CID3Tag::openFile(TagLib::IOStream& stream) {
    m_source = taglib::prepareId3Tag(stream);
    auto file = std::make_unique<TagLib::MPEG::File>(&stream, TagLib::ID3v2::FrameFactory::instance());
    // TagLib accepts any bytes as an MP3 file; reject a file with neither a tag nor an audio frame.
    const TagLib::MPEG::Properties* properties = file->audioProperties();
    const bool sound = properties && properties->sampleRate() > 0;
    if (!file->isValid() || (!sound && !file->hasID3v2Tag() && !file->hasID3v1Tag() && !file->hasAPETag()))
        return nullptr;
    m_mpeg = file.get();
    m_tag = file->ID3v2Tag(false);
    if (m_tag && file->hasID3v2Tag()) taglib::keepForeignFrames(*m_tag, m_source);
    m_oldTag = file->ID3v1Tag(false);
    m_apeTag = file->hasAPETag() ? file->APETag(false) : nullptr;
    return file;
}

void CID3Tag::dropTags() {
    m_mpeg = nullptr;
    m_tag = nullptr;
    m_editedIds.clear();
    m_oldTag = nullptr;
    m_apeTag = nullptr;
    m_removedPictures.clear();
}

void CID3Tag::createTag() {
    if (!m_tag && m_mpeg) m_tag = m_mpeg->ID3v2Tag(true);
}

P<IString> CID3Tag::getTagType() const {
    if (!m_mpeg) return CString::empty();
    if (m_mpeg->hasID3v2Tag())
        return CString::fromUTF8(
            "ID3v2." + std::to_string(m_source.version ? m_source.version : m_tag->header()->majorVersion()));
    if (m_mpeg->hasID3v1Tag()) return newString("ID3v1");
    return m_apeTag ? newString("APE") : CString::empty();
}

// ID3v1 truncates texts, so the APE tag takes precedence if it has the same text in full.
TagLib::String CID3Tag::readField(EField field) const {
    const TagLib::String text = readFrame(field);
    if (!text.isEmpty()) return text;
    const TagLib::String old = m_oldTag ? readOldField(*m_oldTag, field) : TagLib::String();
    const TagLib::String ape = m_apeTag ? readApeField(*m_apeTag, field) : TagLib::String();
    return old.isEmpty() || ape.startsWith(old) ? ape : old;
}

TagLib::String CID3Tag::readFrame(EField field) const {
    return m_tag ? readTextFrame(*m_tag, field) : TagLib::String();
}

void CID3Tag::writeFrame(EField field, const TagLib::String& text) {
    if (!text.isEmpty()) createTag();
    if (!m_tag) return;
    const std::vector<TagLib::ByteVector> ids = getTextFrameIds(field);
    m_editedIds.insert(m_editedIds.end(), ids.begin(), ids.end());
    writeTextFrame(*m_tag, field, text);
}

void CID3Tag::writeField(EField field, const TagLib::String& text) {
    writeFrame(field, text);
    // Otherwise a removed text would still be read from there.
    if (m_oldTag) writeOldField(*m_oldTag, field, text);
    if (!m_apeTag || readApeField(*m_apeTag, field).isEmpty()) return;
    m_apeTag->removeItem(getApeKey(field));
    if (!text.isEmpty()) m_apeTag->addValue(getApeKey(field), text);
}

// Copies fields that only one of the two tags has to the other. TagLib would do so with integers and lose
// years and track numbers that are not numeric.
//
// Nothing of the old tag may be lost without an error.
bool CID3Tag::save(TagLib::File&, TagLib::IOStream& stream) {
    if (!m_source.unsupported.empty()) taglib::failLostFrame(m_source.unsupported.front(), getURI());
    for (const EField field : kFields) {
        const TagLib::String text = readField(field);
        if (text.isEmpty()) continue;
        if (readFrame(field).isEmpty()) writeFrame(field, text);
        TagLib::ID3v1::Tag* oldTag = m_mpeg->ID3v1Tag(true);
        if (readOldField(*oldTag, field).isEmpty()) writeOldField(*oldTag, field, text);
        m_oldTag = oldTag;
    }
    if (!m_mpeg->save(TagLib::MPEG::File::AllTags, TagLib::MPEG::File::StripOthers, TagLib::ID3v2::v4,
                      TagLib::MPEG::File::DoNotDuplicate))
        return false;
    const TagLib::String lost = taglib::findLostFrame(m_source, taglib::readId3Tag(stream), m_editedIds);
    if (!lost.isEmpty()) taglib::failLostFrame(lost, getURI());
    return true;
}

std::vector<AttachedPictureFrame*> CID3Tag::getPictures() const {
    std::vector<AttachedPictureFrame*> pictures;
    if (!m_tag) return pictures;
    for (TagLib::ID3v2::Frame* frame : m_tag->frameList("APIC"))
        if (auto* picture = dynamic_cast<AttachedPictureFrame*>(frame)) pictures.push_back(picture);
    return pictures;
}

AttachedPictureFrame* CID3Tag::getPicture(int32_t index) const {
    const std::vector<AttachedPictureFrame*> pictures = getPictures();
    return index >= 0 && static_cast<size_t>(index) < pictures.size() ? pictures[static_cast<size_t>(index)]
                                                                      : nullptr;
}

bool CID3Tag::holds(const AttachedPictureFrame* picture) const {
    const std::vector<AttachedPictureFrame*> pictures = getPictures();
    return std::find(pictures.begin(), pictures.end(), picture) != pictures.end();
}

int32_t CID3Tag::getCoverArtCount() const {
    return static_cast<int32_t>(getPictures().size());
}

P<ICoverArt> CID3Tag::getCoverArt(int32_t index) const {
    AttachedPictureFrame* picture = getPicture(index);
    m_editedIds.emplace_back("APIC"); // it can be changed through the handle
    return picture ? P<ICoverArt>(make<CCoverArt>(P<const CID3Tag>::share(this), picture)) : nullptr;
}

void CID3Tag::addCoverArt(const P<CMemoryBlock>& data, const CStringArg& mimeType, EPictureType type) {
    createTag();
    if (!m_tag) return;
    auto picture = std::make_unique<AttachedPictureFrame>();
    taglib::fillPicture(*picture, data, mimeType,
                        type == kFrontCover || type == kBackCover ? type : kOtherPicture);
    m_tag->addFrame(picture.release());
    m_editedIds.emplace_back("APIC");
    markChanged();
}

void CID3Tag::removeCoverArt(int32_t index) {
    AttachedPictureFrame* picture = getPicture(index);
    if (!picture) return;
    m_tag->removeFrame(picture, false);
    m_removedPictures.emplace_back(picture);
    m_editedIds.emplace_back("APIC");
    markChanged();
}

} // namespace filetag::id3tag

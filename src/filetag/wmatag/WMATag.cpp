#include "filetag/wmatag/WMATag.h"

#include "filetag/taglib/AsfObjects.h"
#include "filetag/wmatag/CoverArt.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

#include <algorithm>
#include <array>

namespace filetag::wmatag {

using namespace peru;
using taglib::EField;

namespace {

constexpr char kPicture[] = "WM/Picture";
// Title, artist and comment have 16-bit lengths in bytes that include a terminating zero.
constexpr unsigned int kLongestText = 0xffff / 2 - 1;

// `first` is the attribute that is written, null for the fields that TagLib stores separately. `others` are
// read if it is missing and removed when the field is set: further values, and names that other programs use.
struct SNames {
    const char* first;
    std::array<const char*, 2> others;
};

SNames getNames(EField field) {
    switch (field) {
    case EField::title:
        return {nullptr, {"Title", "title"}};
    case EField::artist:
        return {nullptr, {"Author"}};
    case EField::comment:
        return {nullptr, {"Description"}};
    case EField::album:
        return {"WM/AlbumTitle", {}};
    case EField::genre:
        return {"WM/Genre", {}};
    case EField::albumArtist:
        return {"WM/AlbumArtist", {}};
    case EField::trackNumber:
        return {"WM/TrackNumber", {"WM/Track"}};
    case EField::year:
        return {"WM/Year", {"date"}};
    }
    return {nullptr, {}};
}

// Some programs write numbers as integer attributes.
TagLib::String toText(const TagLib::ASF::Attribute& attribute) {
    switch (attribute.type()) {
    case TagLib::ASF::Attribute::WordType:
        return TagLib::String::number(attribute.toUShort());
    case TagLib::ASF::Attribute::DWordType:
        return TagLib::String(std::to_string(attribute.toUInt()));
    case TagLib::ASF::Attribute::QWordType:
        return TagLib::String(std::to_string(attribute.toULongLong()));
    default:
        return attribute.toString();
    }
}

TagLib::String getFirst(const TagLib::ASF::Tag& tag, const char* name) {
    if (!name) return {};
    const TagLib::ASF::AttributeList values = tag.attribute(name);
    return values.isEmpty() ? TagLib::String() : toText(values.front());
}

} // namespace

CWMATag::CWMATag(const P<IURI>& file) : CTagLibTag(file) {}

CWMATag::~CWMATag() {
    close();
}

std::unique_ptr<TagLib::File> CWMATag::openFile(TagLib::IOStream& stream) {
    taglib::orderAsfObjects(stream);
    auto file = std::make_unique<TagLib::ASF::File>(&stream);
    if (!file->isValid()) return nullptr;
    m_tag = file->tag();
    for (int32_t count = getCoverArtCount(); count > 0; --count) m_pictureIds.push_back(++m_lastPictureId);
    return file;
}

void CWMATag::dropTags() {
    m_tag = nullptr;
    m_pictureIds.clear();
}

bool CWMATag::holdsPicture(uint32_t id) const {
    return std::find(m_pictureIds.begin(), m_pictureIds.end(), id) != m_pictureIds.end();
}

P<IString> CWMATag::getTagType() const {
    return m_tag ? newString("ASF") : CString::empty();
}

TagLib::String CWMATag::readOwnField(EField field) const {
    switch (field) {
    case EField::title:
        return m_tag->title();
    case EField::artist:
        return m_tag->artist();
    case EField::comment:
        return m_tag->comment();
    default:
        return getFirst(*m_tag, getNames(field).first);
    }
}

TagLib::String CWMATag::readField(EField field) const {
    if (!m_tag) return {};
    TagLib::String text = readOwnField(field);
    for (const char* other : getNames(field).others)
        if (text.isEmpty()) text = getFirst(*m_tag, other);
    return text;
}

void CWMATag::writeField(EField field, const TagLib::String& text) {
    if (!m_tag) return;
    const SNames names = getNames(field);
    for (const char* other : names.others)
        if (other) m_tag->removeItem(other);
    switch (field) {
    case EField::title:
        return m_tag->setTitle(text);
    case EField::artist:
        return m_tag->setArtist(text);
    case EField::comment:
        return m_tag->setComment(text);
    default:
        m_tag->removeItem(names.first);
        if (!text.isEmpty()) m_tag->setAttribute(names.first, TagLib::ASF::Attribute(text));
    }
}

// TagLib would write a truncated length for a longer text, and readers would continue in the middle of it.
bool CWMATag::save(TagLib::File& file, TagLib::IOStream&) {
    for (const TagLib::String& text : {m_tag->title(), m_tag->artist(), m_tag->comment()})
        if (text.size() > kLongestText)
            throw CFileError(localize("filetag.CWMATag.TooLong", "The tag is too long for the file '%FILE%'.",
                                      {{"%FILE%", getShownName(getURI())}}),
                             getURI());
    return file.save();
}

int32_t CWMATag::getCoverArtCount() const {
    return m_tag ? static_cast<int32_t>(m_tag->attribute(kPicture).size()) : 0;
}

P<ICoverArt> CWMATag::getCoverArt(int32_t index) const {
    if (index < 0 || index >= getCoverArtCount()) return nullptr;
    const TagLib::ASF::AttributeList pictures = m_tag->attribute(kPicture);
    return make<CCoverArt>(P<const CWMATag>::share(this),
                           pictures[static_cast<unsigned int>(index)].toPicture(),
                           m_pictureIds[static_cast<size_t>(index)]);
}

void CWMATag::addCoverArt(const P<CMemoryBlock>& data, const CStringArg& mimeType, EPictureType type) {
    if (!m_tag) return;
    TagLib::ASF::Picture picture;
    taglib::fillPicture(picture, data, mimeType, type);
    m_tag->addAttribute(kPicture, TagLib::ASF::Attribute(picture));
    m_pictureIds.push_back(++m_lastPictureId);
    markChanged();
}

void CWMATag::removeCoverArt(int32_t index) {
    if (index < 0 || index >= getCoverArtCount()) return;
    TagLib::ASF::AttributeList pictures = m_tag->attribute(kPicture);
    auto picture = pictures.begin();
    std::advance(picture, index);
    pictures.erase(picture);
    m_pictureIds.erase(m_pictureIds.begin() + index);
    if (pictures.isEmpty())
        m_tag->removeItem(kPicture);
    else
        m_tag->setAttribute(kPicture, pictures);
    markChanged();
}

} // namespace filetag::wmatag

#include "filetag/wmatag/WMATag.h"

#include "filetag/wmatag/CoverArt.h"
#include "peru/Errors.h"
#include "peru/IPathes.h"
#include "peru/IStringLocalizer.h"

namespace filetag::wmatag {

using namespace peru;
using taglib::EField;

namespace {

constexpr char kPicture[] = "WM/Picture";
// Title, artist and comment stand in an object whose lengths have 16 bits and count a zero at the end.
constexpr unsigned int kLongestText = 0xffff / 2 - 1;

struct SNames {
    const char* first; // is written, both are read
    const char* second;
};

// Empty for the fields that are no attributes.
SNames getNames(EField field) {
    switch (field) {
    case EField::album:
        return {"WM/AlbumTitle", nullptr};
    case EField::genre:
        return {"WM/Genre", nullptr};
    case EField::albumArtist:
        return {"WM/AlbumArtist", nullptr};
    case EField::trackNumber:
        return {"WM/TrackNumber", "WM/Track"};
    case EField::year:
        return {"WM/Year", nullptr};
    default:
        return {nullptr, nullptr};
    }
}

// Some programs write numbers as numbers.
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
    auto file = std::make_unique<TagLib::ASF::File>(&stream);
    if (!file->isValid()) return nullptr;
    m_tag = file->tag();
    return file;
}

P<IString> CWMATag::getTagType() const {
    return m_tag ? newString("ASF") : CString::empty();
}

TagLib::String CWMATag::readField(EField field) const {
    if (!m_tag) return {};
    switch (field) {
    case EField::title:
        return m_tag->title();
    case EField::artist:
        return m_tag->artist();
    case EField::comment:
        return m_tag->comment();
    default:
        break;
    }
    const SNames names = getNames(field);
    const TagLib::String text = getFirst(*m_tag, names.first);
    return text.isEmpty() ? getFirst(*m_tag, names.second) : text;
}

void CWMATag::writeField(EField field, const TagLib::String& text) {
    if (!m_tag) return;
    // Values after the first of title, artist and comment are attributes.
    switch (field) {
    case EField::title:
        m_tag->removeItem("Title");
        return m_tag->setTitle(text);
    case EField::artist:
        m_tag->removeItem("Author");
        return m_tag->setArtist(text);
    case EField::comment:
        m_tag->removeItem("Description");
        return m_tag->setComment(text);
    default:
        break;
    }
    const SNames names = getNames(field);
    m_tag->removeItem(names.first);
    if (names.second) m_tag->removeItem(names.second);
    if (!text.isEmpty()) m_tag->setAttribute(names.first, TagLib::ASF::Attribute(text));
}

// TagLib would write what is too long with a length that leads into the middle of it.
bool CWMATag::save(TagLib::File& file) {
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
                           pictures[static_cast<unsigned int>(index)].toPicture());
}

void CWMATag::addCoverArt(const P<CMemoryBlock>& data, const CStringArg& mimeType, EPictureType type) {
    if (!m_tag) return;
    TagLib::ASF::Picture picture;
    taglib::fillPicture(picture, data, mimeType, type);
    m_tag->addAttribute(kPicture, TagLib::ASF::Attribute(picture));
    markChanged();
}

void CWMATag::removeCoverArt(int32_t index) {
    if (index < 0 || index >= getCoverArtCount()) return;
    TagLib::ASF::AttributeList pictures = m_tag->attribute(kPicture);
    auto picture = pictures.begin();
    std::advance(picture, index);
    pictures.erase(picture);
    if (pictures.isEmpty())
        m_tag->removeItem(kPicture);
    else
        m_tag->setAttribute(kPicture, pictures);
    markChanged();
}

} // namespace filetag::wmatag

#include "filetag/taglib/XiphTag.h"

namespace filetag::taglib {
namespace {

// Fields for which TagLib has no operation or only a number. The first name is written, both are read.
struct SNames {
    const char* first;
    const char* second;
};

SNames getNames(EField field) {
    if (field == EField::albumArtist) return {"ALBUMARTIST", nullptr};
    if (field == EField::trackNumber) return {"TRACKNUMBER", "TRACKNUM"};
    return {"DATE", "YEAR"};
}

TagLib::String getFirst(const TagLib::Ogg::XiphComment& comment, const char* name) {
    const TagLib::Ogg::FieldListMap& fields = comment.fieldListMap();
    const auto found = name ? fields.find(name) : fields.end();
    return found == fields.end() || found->second.isEmpty() ? TagLib::String() : found->second.front();
}

} // namespace

TagLib::String CXiphTag::readField(EField field) const {
    if (!m_comment) return {};
    switch (field) {
    case EField::title:
        return m_comment->title();
    case EField::artist:
        return m_comment->artist();
    case EField::album:
        return m_comment->album();
    case EField::genre:
        return m_comment->genre();
    case EField::comment:
        return m_comment->comment();
    default:
        break;
    }
    const SNames names = getNames(field);
    const TagLib::String text = getFirst(*m_comment, names.first);
    return text.isEmpty() ? getFirst(*m_comment, names.second) : text;
}

void CXiphTag::writeField(EField field, const TagLib::String& text) {
    if (!m_comment) return;
    switch (field) {
    case EField::title:
        return m_comment->setTitle(text);
    case EField::artist:
        return m_comment->setArtist(text);
    case EField::album:
        return m_comment->setAlbum(text);
    case EField::genre:
        return m_comment->setGenre(text);
    case EField::comment:
        return m_comment->setComment(text);
    default:
        break;
    }
    const SNames names = getNames(field);
    if (names.second) m_comment->removeFields(names.second);
    m_comment->addField(names.first, text); // in the place of all by that name; empty removes them
}

} // namespace filetag::taglib

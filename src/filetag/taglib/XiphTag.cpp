#include "filetag/taglib/XiphTag.h"

namespace filetag::taglib {
namespace {

struct SNames {
    const char* first; // takes precedence when reading
    const char* second;
};

SNames getNames(EField field) {
    switch (field) {
    case EField::title:
        return {"TITLE", nullptr};
    case EField::artist:
        return {"ARTIST", nullptr};
    case EField::album:
        return {"ALBUM", nullptr};
    case EField::albumArtist:
        return {"ALBUMARTIST", nullptr};
    case EField::trackNumber:
        return {"TRACKNUMBER", "TRACKNUM"};
    case EField::year:
        return {"DATE", "YEAR"};
    case EField::genre:
        return {"GENRE", nullptr};
    case EField::comment:
        return {"DESCRIPTION", "COMMENT"};
    }
    return {};
}

TagLib::String getFirst(const TagLib::Ogg::XiphComment& comment, const char* name) {
    const TagLib::Ogg::FieldListMap& fields = comment.fieldListMap();
    const auto found = name ? fields.find(name) : fields.end();
    return found == fields.end() || found->second.isEmpty() ? TagLib::String() : found->second.front();
}

} // namespace

void CXiphTag::dropTags() {
    m_comment = nullptr;
    m_removedPictures.clear();
}

TagLib::String CXiphTag::readField(EField field) const {
    if (!m_comment) return {};
    const SNames names = getNames(field);
    const TagLib::String text = getFirst(*m_comment, names.first);
    return text.isEmpty() ? getFirst(*m_comment, names.second) : text;
}

void CXiphTag::writeField(EField field, const TagLib::String& text) {
    if (!m_comment) return;
    const SNames names = getNames(field);
    // Keep the name that the file uses: most players know only one of the two.
    const bool underSecond = field == EField::comment && getFirst(*m_comment, names.first).isEmpty();
    m_comment->removeFields(names.first);
    if (names.second) m_comment->removeFields(names.second);
    if (!text.isEmpty()) m_comment->addField(underSecond ? names.second : names.first, text);
}

} // namespace filetag::taglib

#include "filetag/id3tag/OldTag.h"

#include <string>

namespace filetag::id3tag {

using taglib::EField;

namespace {

TagLib::String toText(unsigned int number) {
    return number == 0 ? TagLib::String() : TagLib::String(std::to_string(number));
}

// Returns 0 if the text does not start with a number or the number is too large.
unsigned int toNumber(const TagLib::String& text, unsigned int largest) {
    unsigned int number = 0;
    for (const wchar_t digit : text) {
        if (digit < L'0' || digit > L'9') break;
        number = number * 10 + static_cast<unsigned int>(digit - L'0');
        if (number > largest) return 0;
    }
    return number;
}

} // namespace

TagLib::String readOldField(const TagLib::ID3v1::Tag& tag, EField field) {
    switch (field) {
    case EField::title:
        return tag.title();
    case EField::artist:
        return tag.artist();
    case EField::album:
        return tag.album();
    case EField::genre:
        return tag.genre();
    case EField::comment:
        return tag.comment();
    case EField::year:
        return toText(tag.year());
    case EField::trackNumber:
        return toText(tag.track());
    case EField::albumArtist:
        break;
    }
    return {};
}

void writeOldField(TagLib::ID3v1::Tag& tag, EField field, const TagLib::String& text) {
    switch (field) {
    case EField::title:
        return tag.setTitle(text);
    case EField::artist:
        return tag.setArtist(text);
    case EField::album:
        return tag.setAlbum(text);
    case EField::genre:
        return tag.setGenre(text);
    case EField::comment:
        return tag.setComment(text);
    case EField::year:
        return tag.setYear(toNumber(text, 9999));
    case EField::trackNumber:
        return tag.setTrack(toNumber(text, 255));
    case EField::albumArtist:
        break;
    }
}

} // namespace filetag::id3tag

#include "media/FileTag.h"

#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"

#include <fstream>
#include <stdexcept>

namespace host {

namespace fs = std::filesystem;

std::string getTitle(const STagField& field) {
    return tr(field.titleKey, field.title);
}

bool isWideWav(const fs::path& file) {
    char start[4] = {};
    std::ifstream(file, std::ios::binary).read(start, sizeof start);
    return std::string_view(start, sizeof start) == "RF64";
}

const std::vector<STagField>& getTagFields() {
    static const std::vector<STagField> kFields{
        {"title", "title", "host.field.title", "title", &CLibrary::FileTag_GetTitle,
         &CLibrary::FileTag_SetTitle},
        {"artist", "artist", "host.field.artist", "artist", &CLibrary::FileTag_GetArtist,
         &CLibrary::FileTag_SetArtist},
        {"album", "album", "host.field.album", "album", &CLibrary::FileTag_GetAlbum,
         &CLibrary::FileTag_SetAlbum},
        {"album-artist", "album_artist", "host.field.albumArtist", "album artist",
         &CLibrary::FileTag_GetAlbumArtist, &CLibrary::FileTag_SetAlbumArtist},
        {"track", "track", "host.field.track", "track", &CLibrary::FileTag_GetTrackNumber,
         &CLibrary::FileTag_SetTrackNumber},
        {"year", "year", "host.field.year", "year", &CLibrary::FileTag_GetYear, &CLibrary::FileTag_SetYear},
        {"genre", "genre", "host.field.genre", "genre", &CLibrary::FileTag_GetGenre,
         &CLibrary::FileTag_SetGenre},
        {"comment", "comment", "host.field.comment", "comment", &CLibrary::FileTag_GetComment,
         &CLibrary::FileTag_SetComment},
    };
    return kFields;
}

CFileTag::CFileTag(CLibrary& library, const fs::path& file) : m_library(library), m_file(file) {
    if (isWideWav(file)) return;
    clearFailure();
    m_tag = CHandle(library.CreateFileTag(toURI(file).c_str()));
    if (m_tag) return;
    if (const std::string reason = takeFailure("", file); !reason.empty()) throw std::runtime_error(reason);
}

std::u16string CFileTag::get(const STagField& field) const {
    const CHandle text((m_library.*field.get)(m_tag.get()));
    if (!text)
        throw std::runtime_error(
            tr("host.Tag.unreadableField", "The %FIELD% cannot be read", {{"%FIELD%", getTitle(field)}}));
    return {TONEWRIGHT_GetText(text.get()), TONEWRIGHT_GetTextLength(text.get())};
}

void CFileTag::set(const STagField& field, const std::u16string& text) {
    (m_library.*field.set)(m_tag.get(), text.c_str());
}

void CFileTag::store() {
    clearFailure();
    if (m_library.StoreFileTag(m_tag.get()) == TONEWRIGHT_OK) return;
    throw std::runtime_error(takeFailure(tr("host.Tag.unwritable", "The tag could not be written"), m_file));
}

} // namespace host

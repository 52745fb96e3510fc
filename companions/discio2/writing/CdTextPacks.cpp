#include "writing/CdTextPacks.h"
#include "Text.h"
#include "writing/BurnLibrary.h"

#include <algorithm>
#include <cstdlib>

namespace discio {

namespace {

constexpr size_t kPackBytes = 18;

struct SPack {
    int text;
    int type;
    bool isOfTracks;
};
constexpr SPack kPacks[] = {
    {DISCIO_TEXT_TITLE, 0x80, true},      {DISCIO_TEXT_PERFORMER, 0x81, true},
    {DISCIO_TEXT_SONGWRITER, 0x82, true}, {DISCIO_TEXT_COMPOSER, 0x83, true},
    {DISCIO_TEXT_ARRANGER, 0x84, true},   {DISCIO_TEXT_MESSAGE, 0x85, true},
    {DISCIO_TEXT_DISC_ID, 0x86, false},   {DISCIO_TEXT_GENRE, 0x87, false},
};

std::vector<uint8_t> toLatin1(const std::string& text, bool isGenre) {
    std::vector<uint8_t> bytes;
    if (isGenre) bytes = {0, 0}; // no code; the text follows
    // Many readers mistake the next text for an empty one.
    for (const char16_t c : toUTF16(text.empty() ? " " : text)) {
        if (c > 0xFF) throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED, "CD-TEXT cannot store \"" + text + "\"");
        bytes.push_back(static_cast<uint8_t>(c));
    }
    bytes.push_back(0);
    return bytes;
}

} // namespace

std::string makeTextPacks(const STableOfContents& contents) {
    const auto isUsed = [&](const SPack& pack) {
        const auto index = static_cast<size_t>(pack.text);
        return !contents.texts[index].empty() ||
               (pack.isOfTracks &&
                std::any_of(contents.tracks.begin(), contents.tracks.end(),
                            [&](const STrack& track) { return !track.texts[index].empty(); }));
    };
    if (std::none_of(std::begin(kPacks), std::end(kPacks), isUsed)) return {};
    const SBurnLibrary& library = SBurnLibrary::get();
    const std::unique_ptr<burn::burn_session, void (*)(burn::burn_session*)> session(
        library.burn_session_create(), library.burn_session_free);
    std::vector<std::unique_ptr<burn::burn_track, void (*)(burn::burn_track*)>> tracks;
    for (size_t i = 0; i < contents.tracks.size(); ++i) {
        tracks.emplace_back(library.burn_track_create(), library.burn_track_free);
        library.burn_session_add_track(session.get(), tracks.back().get(), BURN_POS_END);
    }
    for (const SPack& pack : kPacks) {
        if (!isUsed(pack)) continue;
        const auto index = static_cast<size_t>(pack.text);
        std::vector<uint8_t> text = toLatin1(contents.texts[index], pack.text == DISCIO_TEXT_GENRE);
        library.burn_session_set_cdtext(session.get(), 0, pack.type, nullptr, text.data(),
                                        static_cast<int>(text.size()), 0);
        for (size_t i = 0; pack.isOfTracks && i < tracks.size(); ++i) {
            text = toLatin1(contents.tracks[i].texts[index], false);
            library.burn_track_set_cdtext(tracks[i].get(), 0, pack.type, nullptr, text.data(),
                                          static_cast<int>(text.size()), 0);
        }
    }
    unsigned char* packs = nullptr;
    int count = 0;
    if (library.burn_cdtext_from_session(session.get(), &packs, &count, 0) <= 0 || !packs)
        throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED,
                         "the texts cannot be stored as CD-TEXT: " + library.takeMessage());
    std::string bytes(reinterpret_cast<const char*>(packs), static_cast<size_t>(count) * kPackBytes);
    std::free(packs);
    return bytes;
}

} // namespace discio

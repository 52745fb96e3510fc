#include "CdText.h"

#include <cdio/cdtext.h>
#include <cdio/logging.h>
#include <cstring>
#include <memory>

namespace discio {

namespace {

constexpr size_t kPackBytes = 18;

constexpr std::pair<cdtext_field_t, int> kFields[] = {
    {CDTEXT_FIELD_TITLE, DISCIO_TEXT_TITLE},           {CDTEXT_FIELD_PERFORMER, DISCIO_TEXT_PERFORMER},
    {CDTEXT_FIELD_SONGWRITER, DISCIO_TEXT_SONGWRITER}, {CDTEXT_FIELD_COMPOSER, DISCIO_TEXT_COMPOSER},
    {CDTEXT_FIELD_ARRANGER, DISCIO_TEXT_ARRANGER},     {CDTEXT_FIELD_MESSAGE, DISCIO_TEXT_MESSAGE},
    {CDTEXT_FIELD_DISCID, DISCIO_TEXT_DISC_ID},        {CDTEXT_FIELD_GENRE, DISCIO_TEXT_GENRE},
    {CDTEXT_FIELD_UPC_EAN, DISCIO_TEXT_CODE},          {CDTEXT_FIELD_ISRC, DISCIO_TEXT_CODE},
};

} // namespace

void addCdText(const cdtext_s* texts, STableOfContents& contents) {
    if (!texts) return;
    const auto add = [&](Texts& to, int number) {
        for (const auto& [field, index] : kFields)
            if (const char* text = cdtext_get_const(texts, field, static_cast<track_t>(number)))
                if (text[std::strspn(text, " ")]) // writers put a space where a text is missing
                    to[static_cast<size_t>(index)] = text;
    };
    add(contents.texts, 0);
    for (STrack& track : contents.tracks) add(track.texts, track.number);
}

void addCdText(std::string_view packs, STableOfContents& contents) {
    if (packs.size() % kPackBytes == 4) packs.remove_prefix(4);
    std::vector<uint8_t> bytes(packs.begin(), packs.end());
    bytes.resize(bytes.size() / kPackBytes * kPackBytes);
    if (bytes.empty()) return;
    cdio_log_set_handler([](cdio_log_level_t, const char*) {}); // it would print to standard output
    const std::unique_ptr<cdtext_t, void (*)(cdtext_t*)> texts(cdtext_init(), cdtext_destroy);
    if (texts && cdtext_data_init(texts.get(), bytes.data(), bytes.size()) == 0)
        addCdText(texts.get(), contents);
}

} // namespace discio

#include "graphics/text/LineBreaker.h"

namespace graphics {

namespace {

struct SCharacter {
    size_t end; // offset behind it
    double width = 0;
    bool isBlank = false;
    bool isTab = false;
};

// In the order of the text, whatever the direction in which it is written.
std::vector<SCharacter> measureCharacters(PangoLayout* layout) {
    const char* const text = pango_layout_get_text(layout);
    std::vector<SCharacter> characters;
    std::vector<size_t> indices; // of the character at an offset
    for (const char* at = text; *at;) {
        const char* const next = g_utf8_next_char(at);
        indices.resize(static_cast<size_t>(next - text), characters.size());
        characters.push_back({static_cast<size_t>(next - text), 0, *at == ' ' || *at == '\t', *at == '\t'});
        at = next;
    }
    std::vector<int> widths;
    const PangoLayoutLine* const line = pango_layout_get_line_readonly(layout, 0);
    for (const GSList* node = line->runs; node; node = node->next) {
        auto* const run = static_cast<PangoGlyphItem*>(node->data);
        widths.resize(static_cast<size_t>(run->item->num_chars));
        pango_glyph_item_get_logical_widths(run, text, widths.data());
        size_t index = indices[static_cast<size_t>(run->item->offset)];
        for (const int width : widths) characters[index++].width = static_cast<double>(width) / PANGO_SCALE;
    }
    return characters;
}

double advance(double position, const SCharacter& character, const std::vector<double>& tabs) {
    if (!character.isTab) return position + character.width;
    const auto stop = std::upper_bound(tabs.begin(), tabs.end(), position);
    return stop == tabs.end() ? position + character.width : *stop;
}

} // namespace

std::vector<size_t> breakLines(PangoLayout* layout, double firstWidth, double otherWidth,
                               const std::vector<double>& tabs) {
    const std::vector<SCharacter> characters = measureCharacters(layout);
    std::vector<size_t> ends;
    for (size_t begin = 0; begin < characters.size();) {
        const double room = ends.empty() ? firstWidth : otherWidth;
        size_t end = begin, blank = begin; // behind the last blank
        for (double position = 0; end < characters.size(); ++end) {
            position = advance(position, characters[end], tabs);
            if (position > room && end > begin) break;
            if (characters[end].isBlank) blank = end + 1;
        }
        if (end < characters.size() && blank > begin) end = blank;
        ends.push_back(characters[end - 1].end);
        begin = end;
    }
    if (ends.empty()) ends.push_back(0);
    return ends;
}

} // namespace graphics

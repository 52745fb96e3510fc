#include "graphics/painting/ColourEffect.h"
#include "graphics/text/PangoLayouts.h"

#include <cmath>

namespace graphics {

namespace {

constexpr double kMillimetresPerPoint = 25.4 / 72;
using Context = std::unique_ptr<PangoContext, CTextLayout::SImpl::SUnref>;

// Without hinting, extents do not vary with the scale.
Context makeContext() {
    Context context(pango_font_map_create_context(pango_cairo_font_map_get_default()));
    cairo_font_options_t* const options = cairo_font_options_create();
    cairo_font_options_set_hint_style(options, CAIRO_HINT_STYLE_NONE);
    cairo_font_options_set_hint_metrics(options, CAIRO_HINT_METRICS_OFF);
    cairo_font_options_set_antialias(options, CAIRO_ANTIALIAS_GRAY);
    pango_cairo_context_set_font_options(context.get(), options);
    cairo_font_options_destroy(options);
    pango_context_set_round_glyph_positions(context.get(), FALSE);
    return context;
}

PangoFontDescription* makeDescription(const SFont& font) {
    PangoFontDescription* const description = pango_font_description_new();
    pango_font_description_set_family(description, font.name.c_str());
    pango_font_description_set_absolute_size(description, font.pointSize * kMillimetresPerPoint *
                                                              kUnitsPerMillimetre * PANGO_SCALE);
    pango_font_description_set_style(description, font.style == 93   ? PANGO_STYLE_ITALIC
                                                  : font.style == 94 ? PANGO_STYLE_OBLIQUE
                                                                     : PANGO_STYLE_NORMAL);
    // Old files: 90 normal, 91 light, 92 bold.
    const int weight = font.weight == 90   ? 400
                       : font.weight == 91 ? 300
                       : font.weight == 92 ? 700
                                           : font.weight;
    pango_font_description_set_weight(description, static_cast<PangoWeight>(std::clamp(weight, 100, 1000)));
    return description;
}

void add(PangoAttrList* list, PangoAttribute* attribute, size_t begin, size_t end) {
    attribute->start_index = static_cast<guint>(begin);
    attribute->end_index = static_cast<guint>(end);
    pango_attr_list_insert(list, attribute);
}

void addStyle(PangoAttrList* list, const STextRun& run, size_t begin, size_t end, EEffect effect) {
    PangoFontDescription* const description = makeDescription(run.font);
    add(list, pango_attr_font_desc_new(description), begin, end);
    pango_font_description_free(description);
    const SColour colour = applyEffect(run.colour, effect);
    const auto widen = [](uint8_t value) { return static_cast<guint16>(value * 257); };
    add(list, pango_attr_foreground_new(widen(colour.red), widen(colour.green), widen(colour.blue)), begin,
        end);
    // 0 is not allowed, and means opaque.
    add(list, pango_attr_foreground_alpha_new(std::max<guint16>(1, widen(colour.alpha))), begin, end);
    if (run.font.isUnderlined) add(list, pango_attr_underline_new(PANGO_UNDERLINE_SINGLE), begin, end);
}

// Invalid bytes are replaced, since the layout would drop the whole text.
std::string makeValid(const std::string& text) {
    gchar* const valid = g_utf8_make_valid(text.data(), static_cast<gssize>(text.size()));
    std::string result(valid);
    g_free(valid);
    return result;
}

} // namespace

CTextLayout::CTextLayout(const std::vector<SParagraph>& paragraphs, double width, EEffect effect)
    : m_impl(std::make_unique<SImpl>()) {
    const Context context = makeContext();
    for (const SParagraph& paragraph : paragraphs) {
        SImpl::SBlock block{std::unique_ptr<PangoLayout, SImpl::SUnref>(pango_layout_new(context.get())), 0};
        PangoLayout* const layout = block.layout.get();
        PangoFontDescription* const description = makeDescription(paragraph.font);
        pango_layout_set_font_description(layout, description);
        pango_font_description_free(description);
        std::string text;
        PangoAttrList* const attributes = pango_attr_list_new();
        for (const STextRun& run : paragraph.runs) {
            const size_t begin = text.size();
            text += makeValid(run.text);
            if (text.size() > begin) addStyle(attributes, run, begin, text.size(), effect);
        }
        pango_layout_set_text(layout, text.data(), static_cast<int>(text.size()));
        pango_layout_set_attributes(layout, attributes);
        pango_attr_list_unref(attributes);
        if (width > 0) {
            pango_layout_set_width(
                layout, static_cast<int>(std::min(width, 1e5) * kUnitsPerMillimetre * PANGO_SCALE));
            pango_layout_set_wrap(layout, PANGO_WRAP_WORD);
        }
        pango_layout_set_justify(layout, paragraph.alignment == ETextAlignment::justified);
        pango_layout_set_alignment(layout, paragraph.alignment == ETextAlignment::center  ? PANGO_ALIGN_CENTER
                                           : paragraph.alignment == ETextAlignment::right ? PANGO_ALIGN_RIGHT
                                                                                          : PANGO_ALIGN_LEFT);
        PangoRectangle extents;
        pango_layout_get_extents(layout, nullptr, &extents);
        block.top = m_impl->height;
        m_impl->height += static_cast<double>(extents.height) / PANGO_SCALE;
        m_impl->width = std::max(m_impl->width, static_cast<double>(extents.width) / PANGO_SCALE);
        m_impl->blocks.push_back(std::move(block));
    }
}

CTextLayout::~CTextLayout() = default;

double CTextLayout::GetWidth() const {
    return m_impl->width / kUnitsPerMillimetre;
}

double CTextLayout::GetHeight() const {
    return m_impl->height / kUnitsPerMillimetre;
}

double CTextLayout::GetAscent() const {
    if (m_impl->blocks.empty()) return 0;
    return pango_layout_get_baseline(m_impl->blocks[0].layout.get()) / (kUnitsPerMillimetre * PANGO_SCALE);
}

int CTextLayout::GetLineCount() const {
    int count = 0;
    for (const auto& block : m_impl->blocks) count += pango_layout_get_line_count(block.layout.get());
    return count;
}

} // namespace graphics

#include "graphics/text/PangoLayouts.h"

#include "graphics/painting/CairoBitmap.h"
#include "graphics/painting/ColourEffect.h"

#include <cmath>

namespace graphics {

namespace {

constexpr double kMillimetresPerPoint = 25.4 / 72;
constexpr char kObjectCharacter[] = "\xEF\xBF\xBC"; // U+FFFC stands for an image

using FontDescription = std::unique_ptr<PangoFontDescription, decltype(&pango_font_description_free)>;

FontDescription makeDescription(const SFont& font, double scale) {
    FontDescription description(pango_font_description_new(), pango_font_description_free);
    pango_font_description_set_family(description.get(), font.name.c_str());
    // Files of labels may have any size. FreeType has no fonts above 65535 units.
    const int pointSize = std::clamp(font.pointSize, 1, 1800);
    pango_font_description_set_absolute_size(description.get(), pointSize * scale * kMillimetresPerPoint *
                                                                    kUnitsPerMillimetre * PANGO_SCALE);
    pango_font_description_set_style(description.get(), font.style == 93   ? PANGO_STYLE_ITALIC
                                                        : font.style == 94 ? PANGO_STYLE_OBLIQUE
                                                                           : PANGO_STYLE_NORMAL);
    // Old files: 90 normal, 91 light, 92 bold.
    const int weight = font.weight == 90   ? 400
                       : font.weight == 91 ? 300
                       : font.weight == 92 ? 700
                                           : font.weight;
    pango_font_description_set_weight(description.get(),
                                      static_cast<PangoWeight>(std::clamp(weight, 100, 1000)));
    return description;
}

// Attributes for a range of a text's bytes.
class CAttributes {
public:
    CAttributes() : m_list(pango_attr_list_new()) {}
    ~CAttributes() { pango_attr_list_unref(m_list); }
    CAttributes(const CAttributes&) = delete;
    CAttributes& operator=(const CAttributes&) = delete;

    void setRange(size_t begin, size_t end) {
        m_begin = static_cast<guint>(begin);
        m_end = static_cast<guint>(end);
    }
    void add(PangoAttribute* attribute) {
        attribute->start_index = m_begin;
        attribute->end_index = m_end;
        pango_attr_list_insert(m_list, attribute);
    }
    PangoAttrList* get() const { return m_list; }

private:
    PangoAttrList* const m_list;
    guint m_begin = 0;
    guint m_end = 0;
};

void addColours(CAttributes& attributes, const STextRun& run, EEffect effect) {
    const auto widen = [](uint8_t value) { return static_cast<guint16>(value * 257); };
    const SColour colour = applyEffect(run.colour, effect);
    attributes.add(pango_attr_foreground_new(widen(colour.red), widen(colour.green), widen(colour.blue)));
    // 0 is not allowed, and means opaque.
    attributes.add(pango_attr_foreground_alpha_new(std::max<guint16>(1, widen(colour.alpha))));
    if (run.background.alpha == 0) return;
    const SColour back = applyEffect(run.background, effect);
    attributes.add(pango_attr_background_new(widen(back.red), widen(back.green), widen(back.blue)));
    attributes.add(pango_attr_background_alpha_new(std::max<guint16>(1, widen(back.alpha))));
}

// Small text touches the top or the bottom of full-size text, so it does not make the line higher.
double getRise(PangoContext* context, const STextRun& run) {
    const SFontHeight small = getFontHeight(context, run.font, run.scale);
    const SFontHeight full = getFontHeight(context, run.font, run.scale * 1.5);
    return run.script == ETextScript::superscript ? full.ascent - small.ascent : small.descent - full.descent;
}

void addStyle(CAttributes& attributes, PangoContext* context, const STextRun& run, EEffect effect) {
    attributes.add(pango_attr_font_desc_new(makeDescription(run.font, run.scale).get()));
    addColours(attributes, run, effect);
    if (run.font.isUnderlined) attributes.add(pango_attr_underline_new(PANGO_UNDERLINE_SINGLE));
    if (run.isStruckThrough) attributes.add(pango_attr_strikethrough_new(TRUE));
    if (run.script != ETextScript::normal)
        attributes.add(pango_attr_rise_new(static_cast<int>(getRise(context, run) * PANGO_SCALE)));
}

void addImage(CAttributes& attributes, const STextRun& run, EEffect effect, CTextLayout::SImpl& target) {
    P<CBitmap> bitmap = run.image;
    if (effect != EEffect::none) {
        // Images are laid out twice: to find the lines, and in their line.
        P<CBitmap>& changed = target.changedBitmaps[run.image.get()];
        if (!changed) changed = applyEffect(*run.image, effect);
        bitmap = changed;
    }
    auto& images = target.images;
    images.push_back(std::make_unique<SInlineImage>(SInlineImage{
        bitmap, run.imageSize.width * kUnitsPerMillimetre, run.imageSize.height * kUnitsPerMillimetre}));
    const SInlineImage& image = *images.back();
    const PangoRectangle rect{0, static_cast<int>(-image.height * PANGO_SCALE),
                              static_cast<int>(image.width * PANGO_SCALE),
                              static_cast<int>(image.height * PANGO_SCALE)};
    attributes.add(pango_attr_shape_new_with_data(&rect, &rect, images.back().get(), nullptr, nullptr));
}

// Called while a layout is painted, with the current point on the baseline.
void paintShape(cairo_t* cairo, PangoAttrShape* shape, gboolean isPath, gpointer) {
    if (isPath) return;
    const auto& image = *static_cast<const SInlineImage*>(shape->data);
    double x = 0, y = 0;
    cairo_get_current_point(cairo, &x, &y);
    cairo_save(cairo);
    paintBitmap(
        cairo, *image.bitmap,
        {0, 0, static_cast<double>(image.bitmap->GetWidth()), static_cast<double>(image.bitmap->GetHeight())},
        {x, y - image.height, image.width, image.height});
    cairo_restore(cairo);
}

} // namespace

Context makePangoContext() {
    Context context(pango_font_map_create_context(pango_cairo_font_map_get_default()));
    cairo_font_options_t* const options = cairo_font_options_create();
    cairo_font_options_set_hint_style(options, CAIRO_HINT_STYLE_NONE);
    cairo_font_options_set_hint_metrics(options, CAIRO_HINT_METRICS_OFF);
    cairo_font_options_set_antialias(options, CAIRO_ANTIALIAS_GRAY);
    pango_cairo_context_set_font_options(context.get(), options);
    cairo_font_options_destroy(options);
    pango_context_set_round_glyph_positions(context.get(), FALSE);
    pango_cairo_context_set_shape_renderer(context.get(), paintShape, nullptr, nullptr);
    return context;
}

SFontHeight getFontHeight(PangoContext* context, const SFont& font, double scale) {
    PangoFontMetrics* const metrics =
        pango_context_get_metrics(context, makeDescription(font, scale).get(), nullptr);
    const SFontHeight height{static_cast<double>(pango_font_metrics_get_ascent(metrics)) / PANGO_SCALE,
                             static_cast<double>(pango_font_metrics_get_descent(metrics)) / PANGO_SCALE};
    pango_font_metrics_unref(metrics);
    return height;
}

void prepareText(STextRun& run) {
    if (run.image) {
        run.text = kObjectCharacter;
        return;
    }
    gchar* text = g_utf8_make_valid(run.text.data(), static_cast<gssize>(run.text.size()));
    if (run.isCapitals) {
        gchar* const capitals = g_utf8_strup(text, -1);
        g_free(text);
        text = capitals;
    }
    run.text = text;
    g_free(text);
}

Layout makePangoLayout(PangoContext* context, const SParagraph& paragraph, const std::vector<STextRun>& runs,
                       EEffect effect, CTextLayout::SImpl& target) {
    Layout layout(pango_layout_new(context));
    pango_layout_set_font_description(layout.get(),
                                      makeDescription(paragraph.font, paragraph.fontScale).get());
    std::string text;
    CAttributes attributes;
    for (const STextRun& run : runs) {
        const size_t begin = text.size();
        text += run.text;
        if (text.size() == begin) continue;
        attributes.setRange(begin, text.size());
        if (run.image)
            addImage(attributes, run, effect, target);
        else
            addStyle(attributes, context, run, effect);
    }
    pango_layout_set_single_paragraph_mode(layout.get(), TRUE);
    pango_layout_set_text(layout.get(), text.data(), static_cast<int>(text.size()));
    pango_layout_set_attributes(layout.get(), attributes.get());
    return layout;
}

} // namespace graphics

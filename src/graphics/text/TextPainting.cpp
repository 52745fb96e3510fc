// How the elements with text are painted.
#include "graphics/elements/BasicElements.h"
#include "graphics/elements/GraphicTable.h"
#include "graphics/elements/GraphicText.h"
#include "graphics/painting/PaintContext.h"
#include "graphics/text/LayoutCache.h"
#include "graphics/text/RichTextParser.h"
#include "peru/strings/IStringLocalizer.h"

#include <pango/pango.h>

#include <cmath>
#include <numbers>

namespace graphics {

namespace {

constexpr SColour kHintColour{128, 128, 128, 255};
constexpr size_t kMaximalCircleText = 5000; // characters; a circle has room for far fewer

std::vector<SParagraph> makeLine(const std::string& text, const SFont& font, const SColour& colour,
                                 ETextAlignment alignment = ETextAlignment::left) {
    return {{{{text, font, colour}}, alignment, font}};
}

// Aligned within the height of the box, and clipped to the box.
void paintInBox(CPaintContext& context, const CTextLayout& layout, const SRect& box, int placement) {
    IGraphicsContext& graphics = context.GetGraphics();
    const double room = box.height - layout.GetHeight();
    graphics.PushClip(box);
    graphics.DrawLayout(layout, {box.left, box.top + room * 0.5 * placement});
    graphics.PopClip();
}

void paintInBox(CPaintContext& context, const std::vector<SParagraph>& paragraphs, const SRect& box,
                int placement) {
    if (!(box.width > 0 && box.height > 0)) return;
    paintInBox(context, CTextLayout(paragraphs, box.width, context.GetGraphics().GetEffect()), box,
               placement);
}

void paintHint(CPaintContext& context, const SRect& box, const char* key, const char* text) {
    if (context.GetOutputKind() != EOutputKind::screen) return;
    paintInBox(context, makeLine(peru::CString::toStdString(peru::localize(key, text)), SFont(), kHintColour),
               box, 0);
}

// A character with the marks that belong to it, in its style.
struct SGlyph {
    std::unique_ptr<CTextLayout> layout;
    double width;
};

// The text cut where a cursor could stand.
std::vector<std::string> splitCharacters(const std::string& text) {
    gchar* const valid = g_utf8_make_valid(text.data(), static_cast<gssize>(text.size()));
    const auto count = static_cast<size_t>(g_utf8_strlen(valid, -1));
    std::vector<PangoLogAttr> attributes(count + 1);
    pango_get_log_attrs(valid, -1, -1, pango_language_get_default(), attributes.data(),
                        static_cast<int>(attributes.size()));
    std::vector<std::string> characters;
    const gchar* at = valid;
    for (size_t i = 0; i < count; ++i) {
        const gchar* const next = g_utf8_next_char(at);
        if (characters.empty() || attributes[i].is_cursor_position) characters.emplace_back();
        characters.back().append(at, next);
        at = next;
    }
    g_free(valid);
    return characters;
}

std::vector<SGlyph> splitGlyphs(const std::vector<SParagraph>& paragraphs, EEffect effect) {
    std::vector<SGlyph> glyphs;
    const auto add = [&](const std::string& text, const STextRun& run) {
        STextRun glyph = run;
        glyph.text = text;
        auto layout = std::make_unique<CTextLayout>(
            std::vector<SParagraph>{{{glyph}, ETextAlignment::left, run.font, run.scale}}, 0, effect);
        const double width = layout->GetWidth();
        glyphs.push_back({std::move(layout), width});
    };
    for (const SParagraph& paragraph : paragraphs) {
        // Paragraphs follow each other on the circle.
        if (!glyphs.empty() && !paragraph.runs.empty()) add(" ", paragraph.runs[0]);
        for (const STextRun& run : paragraph.runs)
            for (const std::string& text : splitCharacters(run.text.substr(0, kMaximalCircleText))) {
                if (glyphs.size() >= kMaximalCircleText) return glyphs;
                add(text == "\n" || text == "\t" ? " " : text, run);
            }
    }
    return glyphs;
}

} // namespace

void CGraphicLabel::PaintContent(CPaintContext& context) const {
    if (!m_text.empty()) paintInBox(context, makeLine(m_text, m_font, m_colour), GetLocalRect(), 1);
}

// Buttons are an aid for editing.
void CGraphicStateButton::PaintContent(CPaintContext& context) const {
    if (context.GetOutputKind() != EOutputKind::screen) return;
    const SRect box = GetLocalRect();
    const SFill fill{{{225, 225, 225, 255}}, {}, {}};
    const SPen pen{kHintColour};
    context.GetGraphics().DrawPath(CPath::roundedRectangle(box, 1), &fill, &pen);
    paintInBox(context, makeLine(m_label, SFont(), SColour(), ETextAlignment::center), box, 1);
}

void CGraphicText::PaintContent(CPaintContext& context) const {
    const SRect box = GetLocalRect();
    if (!(box.width > 0 && box.height > 0)) return;
    if (!m_layout) m_layout = std::make_unique<CLayoutCache>();
    const CTextLayout* const layout =
        m_text ? &m_layout->Get(m_text, box.width, context.GetGraphics().GetEffect()) : nullptr;
    if (!layout || layout->IsEmpty())
        paintHint(context, box, "graphics.Text.ClickToEdit", "Double click to edit!");
    else
        paintInBox(context, *layout, box, static_cast<int>(m_placement));
}

void CGraphicTextCircle::PaintContent(CPaintContext& context) const {
    const SRect box = GetLocalRect();
    std::vector<SGlyph> glyphs;
    if (GetText()) glyphs = splitGlyphs(parseRichText(*GetText()), context.GetGraphics().GetEffect());
    if (glyphs.empty())
        return paintHint(context, box, "graphics.GraphicTextCircle.ClickToEdit", "Double click to edit!");
    double length = 0, ascent = 0, descent = 0;
    for (const SGlyph& glyph : glyphs) {
        length += glyph.width;
        ascent = std::max(ascent, glyph.layout->GetAscent());
        descent = std::max(descent, glyph.layout->GetHeight() - glyph.layout->GetAscent());
    }
    // The text touches the circle from inside, with its top if it stands on the circle, otherwise with its
    // foot.
    const bool isConvex = m_circleType == ECircleType::convex;
    const double radius = 0.5 * std::min(box.width, box.height) - (isConvex ? ascent : descent);
    if (!(radius > 0)) return;
    const double direction = isConvex ? 1 : -1;
    double along = -0.5 * length; // of the middle of the text, which is at the top
    for (const SGlyph& glyph : glyphs) {
        const double angle = direction * (along + glyph.width * 0.5) / radius * 180 / std::numbers::pi;
        along += glyph.width;
        // Not CMatrix::rotation of whole degrees: glyphs stand at any angle.
        const CPaintContext::CScope scope(context, CMatrix::rotation(angle) *
                                                       CMatrix::translation(0, -radius) *
                                                       CMatrix::rotation(isConvex ? 0 : 180));
        context.GetGraphics().DrawLayout(*glyph.layout, {glyph.width * -0.5, -glyph.layout->GetAscent()});
    }
}

void CGraphicTable::PaintContent(CPaintContext& context) const {
    const SRect box = GetLocalRect();
    const double totalWidth = GetTotalWidth(), totalHeight = GetTotalHeight();
    if (!HasText() || !(totalWidth > 0 && totalHeight > 0))
        return paintHint(context, box, "graphics.GraphicTable.ClickToEdit", "Double click to edit!");
    double top = box.top;
    for (size_t row = 0; row < m_rows.size(); ++row) {
        const double height = m_rows[row]->height * box.height / totalHeight;
        double left = box.left;
        for (size_t col = 0; col < m_cols.size(); ++col) {
            if (!m_cols[col]->isShown()) continue;
            const double width = m_cols[col]->width * box.width / totalWidth;
            CCell& cell = *m_cells[row][col];
            const SRect inner = SRect{left, top, width, height}.inflated(-cell.margin);
            left += width;
            if (!cell.text || !(inner.width > 0 && inner.height > 0) || !context.CanSee(inner)) continue;
            if (!cell.layout || cell.isLayoutStale) cell.layout = std::make_unique<CLayoutCache>();
            cell.isLayoutStale = false;
            paintInBox(context, cell.layout->Get(cell.text, inner.width, context.GetGraphics().GetEffect()),
                       inner, static_cast<int>(cell.verticalAlign));
        }
        top += height;
    }
}

} // namespace graphics

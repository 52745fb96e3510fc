#include "graphics/text/TextLayout.h"

#include "graphics/text/LineBreaker.h"
#include "graphics/text/PangoLayouts.h"

namespace graphics {

namespace {

constexpr double kMaximalWidth = 20000;   // millimetres; Pango's numbers end at 20971
constexpr double kMinimalLineWidth = 0.1; // of text between indents that leave no room
constexpr double kDefaultTab = 10;        // distance of the tab stops
constexpr double kTabBehindLast = 5;      // behind the last one that a paragraph states
constexpr int kTabCount = 20;

using Runs = std::vector<STextRun>;

double toUnits(int pango) {
    return static_cast<double>(pango) / PANGO_SCALE;
}

double getShare(ETextAlignment alignment) {
    return alignment == ETextAlignment::right ? 1 : alignment == ETextAlignment::center ? 0.5 : 0;
}

// The text between the line breaks that it states.
std::vector<Runs> splitLines(const Runs& runs) {
    std::vector<Runs> lines(1);
    for (const STextRun& run : runs)
        for (size_t begin = 0; begin <= run.text.size();) {
            const size_t end = std::min(run.text.find('\n', begin), run.text.size());
            STextRun& part = lines.back().emplace_back(run);
            part.text = run.text.substr(begin, end - begin);
            if (end < run.text.size()) lines.emplace_back();
            begin = end + 1;
        }
    return lines;
}

// The part between two offsets.
Runs cut(const Runs& runs, size_t begin, size_t end) {
    Runs part;
    size_t offset = 0;
    for (const STextRun& run : runs) {
        const size_t size = run.text.size();
        const size_t from = std::max(begin, offset), to = std::min(end, offset + size);
        if (from < to) {
            part.push_back(run);
            part.back().text = run.text.substr(from - offset, to - from);
        }
        offset += size;
    }
    return part;
}

// In units, from the start of a line.
std::vector<double> getTabs(const SParagraph& paragraph) {
    std::vector<double> tabs = paragraph.tabs;
    const double last = tabs.empty() ? 0 : tabs.back();
    const double step = tabs.empty() ? kDefaultTab : kTabBehindLast;
    for (int i = 1; i <= kTabCount; ++i) tabs.push_back(last + i * step);
    for (double& tab : tabs) tab *= kUnitsPerMillimetre;
    return tabs;
}

void setTabs(PangoLayout* layout, const std::vector<double>& stops) {
    PangoTabArray* const tabs = pango_tab_array_new(static_cast<int>(stops.size()), FALSE);
    for (size_t i = 0; i < stops.size(); ++i)
        pango_tab_array_set_tab(tabs, static_cast<int>(i), PANGO_TAB_LEFT,
                                static_cast<int>(stops[i] * PANGO_SCALE));
    pango_layout_set_tabs(layout, tabs);
    pango_tab_array_free(tabs);
}

// Lays out one paragraph behind the others.
class CParagraphLayout {
public:
    CParagraphLayout(PangoContext* context, const SParagraph& paragraph, double width, EEffect effect,
                     CTextLayout::SImpl& target)
        : m_context(context), m_paragraph(paragraph), m_width(width), m_effect(effect), m_target(target),
          m_left(paragraph.leftIndent * kUnitsPerMillimetre),
          m_subIndent(paragraph.leftSubIndent * kUnitsPerMillimetre), m_tabs(getTabs(paragraph)) {
        const SFontHeight line = getFontHeight(context, paragraph.font, paragraph.fontScale);
        m_spacing = (line.ascent + line.descent) * (paragraph.lineSpacing - 1);
    }

    void run() {
        m_target.height += m_paragraph.spaceBefore * kUnitsPerMillimetre;
        for (Runs& runs : splitLines(m_paragraph.runs)) addText(runs);
        m_target.height += m_paragraph.spaceAfter * kUnitsPerMillimetre;
    }

private:
    // The start of the next line.
    double getStart(bool isFirst) const {
        return isFirst && m_paragraph.bullet.empty() ? m_left : m_left + m_subIndent;
    }
    double getRoom(bool isFirst) const {
        return std::max(m_width - getStart(isFirst) - m_paragraph.rightIndent * kUnitsPerMillimetre,
                        kMinimalLineWidth * kUnitsPerMillimetre);
    }

    // Text without line breaks.
    void addText(Runs& runs) {
        size_t size = 0;
        for (STextRun& run : runs) {
            prepareText(run);
            size += run.text.size();
        }
        if (size > m_target.textLeft) m_target.textLeft = 0;
        if (m_target.textLeft == 0 || m_target.blocks.size() >= kMaximalLines) return;
        m_target.textLeft -= size;
        Layout layout = makeLayout(runs);
        if (!(m_width > 0)) return addLine(std::move(layout), false);
        const auto ends = breakLines(layout.get(), getRoom(m_isFirst), getRoom(false), m_tabs);
        if (ends.size() == 1) return addLine(std::move(layout), false);
        for (size_t i = 0, begin = 0; i < ends.size() && m_target.blocks.size() < kMaximalLines;
             begin = ends[i++]) {
            Runs line = cut(runs, begin, ends[i]);
            const bool isJustified =
                m_paragraph.alignment == ETextAlignment::justified && i + 1 < ends.size();
            // The blank at the end would be stretched as well.
            if (isJustified && line.back().text.back() == ' ') line.back().text.pop_back();
            addLine(makeLayout(line), isJustified);
        }
    }

    Layout makeLayout(const Runs& runs) {
        Layout layout = makePangoLayout(m_context, m_paragraph, runs, m_effect, m_target);
        setTabs(layout.get(), m_tabs);
        return layout;
    }

    void addLine(Layout layout, bool isJustified) {
        const double room = getRoom(m_isFirst);
        if (isJustified) {
            pango_layout_set_width(layout.get(), static_cast<int>(room * PANGO_SCALE));
            pango_layout_set_justify(layout.get(), TRUE);
            pango_layout_set_justify_last_line(layout.get(), TRUE);
        }
        PangoRectangle extents;
        pango_layout_get_extents(layout.get(), nullptr, &extents);
        const double width = toUnits(extents.width);
        double left = 0;
        if (m_width > 0)
            left = getStart(m_isFirst) + std::max(0.0, room - width) * getShare(m_paragraph.alignment);
        if (m_isFirst && m_width > 0 && !m_paragraph.bullet.empty()) addBullet(layout.get());
        m_target.blocks.push_back({std::move(layout), left, m_target.height});
        m_target.height += toUnits(extents.height) + m_spacing;
        m_target.width = std::max(m_target.width, left + width);
        m_isFirst = false;
    }

    // On the baseline of the first line.
    void addBullet(PangoLayout* line) {
        Layout bullet = makePangoLayout(m_context, m_paragraph, m_paragraph.bullet, m_effect, m_target);
        PangoRectangle extents;
        pango_layout_get_extents(bullet.get(), nullptr, &extents);
        const double room = std::max(0.0, m_subIndent - toUnits(extents.width));
        const double top = toUnits(pango_layout_get_baseline(line) - pango_layout_get_baseline(bullet.get()));
        m_target.blocks.push_back({std::move(bullet), m_left + room * getShare(m_paragraph.bulletAlignment),
                                   m_target.height + top, true});
    }

    PangoContext* const m_context;
    const SParagraph& m_paragraph;
    const double m_width; // units; 0 for lines of any length
    const EEffect m_effect;
    CTextLayout::SImpl& m_target;
    const double m_left;
    const double m_subIndent;
    const std::vector<double> m_tabs;
    double m_spacing = 0; // below each line
    bool m_isFirst = true;
};

} // namespace

CTextLayout::CTextLayout(const std::vector<SParagraph>& paragraphs, double width, EEffect effect)
    : m_impl(std::make_unique<SImpl>()) {
    const Context context = makePangoContext();
    const double units = std::min(width, kMaximalWidth) * kUnitsPerMillimetre;
    for (const SParagraph& paragraph : paragraphs)
        CParagraphLayout(context.get(), paragraph, units, effect, *m_impl).run();
    m_impl->height = std::max(0.0, m_impl->height); // spacing below one line may exceed the lines
}

CTextLayout::~CTextLayout() = default;

double CTextLayout::GetWidth() const {
    return m_impl->width / kUnitsPerMillimetre;
}

double CTextLayout::GetHeight() const {
    return m_impl->height / kUnitsPerMillimetre;
}

double CTextLayout::GetAscent() const {
    for (const auto& block : m_impl->blocks)
        if (!block.isBullet)
            return (block.top + toUnits(pango_layout_get_baseline(block.layout.get()))) / kUnitsPerMillimetre;
    return 0;
}

bool CTextLayout::IsEmpty() const {
    return std::none_of(m_impl->blocks.begin(), m_impl->blocks.end(),
                        [](const auto& block) { return *pango_layout_get_text(block.layout.get()) != 0; });
}

int CTextLayout::GetLineCount() const {
    return static_cast<int>(std::count_if(m_impl->blocks.begin(), m_impl->blocks.end(),
                                          [](const auto& block) { return !block.isBullet; }));
}

std::vector<STextLine> CTextLayout::GetLines() const {
    std::vector<STextLine> lines;
    for (const auto& block : m_impl->blocks) {
        if (block.isBullet) continue;
        PangoRectangle extents;
        pango_layout_get_extents(block.layout.get(), nullptr, &extents);
        lines.push_back({block.left / kUnitsPerMillimetre, block.top / kUnitsPerMillimetre,
                         toUnits(extents.width) / kUnitsPerMillimetre,
                         toUnits(extents.height) / kUnitsPerMillimetre,
                         pango_layout_get_text(block.layout.get())});
    }
    return lines;
}

} // namespace graphics

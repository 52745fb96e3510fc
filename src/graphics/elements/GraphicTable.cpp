#include "graphics/elements/GraphicTable.h"

#include "graphics/elements/CloneAs.h"
#include "graphics/text/LayoutCache.h"
#include "graphics/text/RichTextParser.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"

#include <cmath>

namespace graphics {

std::string VerticalAlignToXml(EVerticalAlign align) {
    switch (align) {
    case EVerticalAlign::top:
        return "top";
    case EVerticalAlign::center:
        return "center";
    case EVerticalAlign::bottom:
        return "bottom";
    default:
        return "unknown";
    }
}

EVerticalAlign VerticalAlignFromXml(std::string_view text) {
    for (const EVerticalAlign align : {EVerticalAlign::top, EVerticalAlign::center, EVerticalAlign::bottom})
        if (text == VerticalAlignToXml(align)) return align;
    throw peru::CError("VerticalAlignFromXml. Unknown Align String");
}

P<CGraphicTable::CTableObject> CGraphicTable::CRow::Clone() const {
    auto copy = peru::make<CRow>();
    copy->height = height;
    copy->contentId = contentId;
    return copy;
}

P<CGraphicTable::CTableObject> CGraphicTable::CCol::Clone() const {
    auto copy = peru::make<CCol>();
    copy->width = width;
    copy->isVisible = isVisible;
    copy->isHiddenByTheme = isHiddenByTheme;
    copy->contentId = contentId;
    copy->name = name;
    return copy;
}

std::string CGraphicTable::CCol::getLabel(int number) const {
    return peru::CString::toStdString(
        peru::localize("graphics.CCol.ColumnX", "%INDEX% (%NAME%)",
                       {{"%INDEX%", peru::format("%d", number)}, {"%NAME%", peru::CString::fromUTF8(name)}}));
}

CGraphicTable::CCell::CCell() = default;

CGraphicTable::CCell::~CCell() = default;

P<CGraphicTable::CTableObject> CGraphicTable::CCell::Clone() const {
    auto copy = peru::make<CCell>();
    copy->margin = margin;
    copy->verticalAlign = verticalAlign;
    copy->text = text;
    copy->contentId = contentId;
    return copy;
}

void CGraphicTable::CCell::copyFormat(const CCell& other) {
    margin = other.margin;
    verticalAlign = other.verticalAlign;
    text = other.text ? makeRichTextLike(other.text, {}) : nullptr;
    InvalidateLayout();
}

CGraphicTable::CGraphicTable() {
    SetFlags(GetFlags() | kFlagEditable);
}

std::string CGraphicTable::GetHint() const {
    if (!GetHintText().empty()) return GetHintText();
    return peru::CString::toStdString(
        !HasText()
            ? peru::localize("graphics.GraphicTable.ClickToEdit", "Double click to edit!")
            : peru::localize("graphics.CGraphicElement.ClickToEditTable", "Double click to edit table"));
}

P<CGraphicElement> CGraphicTable::Clone() const {
    return cloneAs(*this);
}

void CGraphicTable::Assign(const CGraphicElement& other) {
    const auto* same = dynamic_cast<const CGraphicTable*>(&other);
    if (same && same != this) {
        m_rows.clear();
        m_cols.clear();
        m_cells.clear();
        for (const auto& row : same->m_rows) m_rows.emplace_back(P<CRow>(row->Clone()));
        for (const auto& col : same->m_cols) m_cols.emplace_back(P<CCol>(col->Clone()));
        for (const auto& row : same->m_cells)
            for (auto& cells = m_cells.emplace_back(); const auto& cell : row)
                cells.emplace_back(P<CCell>(cell->Clone()));
    }
    CGraphicElement::Assign(other);
}

void CGraphicTable::checkRange(const char* method, int index, int count, int size) const {
    if (index >= 0 && count >= 0 && index <= size && count <= size - index) return;
    throw peru::CInvalidArgError(peru::format("index %d, count %d of %d", index, count, size), method,
                                 P<peru::IBase>::share(const_cast<CGraphicTable*>(this)));
}

CGraphicTable::CRow& CGraphicTable::GetRow(int row) const {
    checkRange("GetRow", row, 1, GetRowCount());
    return *m_rows[static_cast<size_t>(row)];
}

CGraphicTable::CCol& CGraphicTable::GetCol(int col) const {
    checkRange("GetCol", col, 1, GetColCount());
    return *m_cols[static_cast<size_t>(col)];
}

CGraphicTable::CCell& CGraphicTable::GetCell(int row, int col) const {
    checkRange("GetCell", row, 1, GetRowCount());
    checkRange("GetCell", col, 1, GetColCount());
    return *m_cells[static_cast<size_t>(row)][static_cast<size_t>(col)];
}

void CGraphicTable::InsertRows(int row, int count) {
    checkRange("InsertRows", row, 0, GetRowCount());
    if (count <= 0) return;
    const int model = std::min(row, GetRowCount() - 1); // -1 for a table without rows
    std::vector<P<CRow>> rows;
    std::vector<std::vector<P<CCell>>> cells;
    for (int i = 0; i < count; ++i) {
        rows.push_back(peru::make<CRow>());
        if (model >= 0) rows.back()->height = GetRow(model).height;
        auto& line = cells.emplace_back();
        for (int col = 0; col < GetColCount(); ++col) {
            line.push_back(peru::make<CCell>());
            if (model >= 0) line.back()->copyFormat(GetCell(model, col));
        }
    }
    m_rows.insert(m_rows.begin() + row, rows.begin(), rows.end());
    m_cells.insert(m_cells.begin() + row, cells.begin(), cells.end());
    DropHitMask();
}

void CGraphicTable::InsertCols(int col, int count) {
    checkRange("InsertCols", col, 0, GetColCount());
    if (count <= 0) return;
    const int model = std::min(col, GetColCount() - 1);
    std::vector<P<CCol>> cols;
    for (int i = 0; i < count; ++i) {
        cols.push_back(peru::make<CCol>());
        if (model >= 0) cols.back()->width = GetCol(model).width;
    }
    for (auto& line : m_cells) {
        std::vector<P<CCell>> cells;
        for (int i = 0; i < count; ++i) {
            cells.push_back(peru::make<CCell>());
            if (model >= 0) cells.back()->copyFormat(*line[static_cast<size_t>(model)]);
        }
        line.insert(line.begin() + col, cells.begin(), cells.end());
    }
    m_cols.insert(m_cols.begin() + col, cols.begin(), cols.end());
    DropHitMask();
}

void CGraphicTable::DeleteRows(int row, int count) {
    checkRange("DeleteRows", row, count, GetRowCount());
    m_rows.erase(m_rows.begin() + row, m_rows.begin() + row + count);
    m_cells.erase(m_cells.begin() + row, m_cells.begin() + row + count);
    DropHitMask();
}

void CGraphicTable::DeleteCols(int col, int count) {
    checkRange("DeleteCols", col, count, GetColCount());
    m_cols.erase(m_cols.begin() + col, m_cols.begin() + col + count);
    for (auto& line : m_cells) line.erase(line.begin() + col, line.begin() + col + count);
    DropHitMask();
}

void CGraphicTable::ExchangeRows(int first, int second) {
    checkRange("ExchangeRows", first, 1, GetRowCount());
    checkRange("ExchangeRows", second, 1, GetRowCount());
    std::swap(m_rows[static_cast<size_t>(first)], m_rows[static_cast<size_t>(second)]);
    std::swap(m_cells[static_cast<size_t>(first)], m_cells[static_cast<size_t>(second)]);
    DropHitMask();
}

void CGraphicTable::ExchangeCols(int first, int second) {
    checkRange("ExchangeCols", first, 1, GetColCount());
    checkRange("ExchangeCols", second, 1, GetColCount());
    std::swap(m_cols[static_cast<size_t>(first)], m_cols[static_cast<size_t>(second)]);
    for (auto& line : m_cells) std::swap(line[static_cast<size_t>(first)], line[static_cast<size_t>(second)]);
    DropHitMask();
}

namespace {

void checkSize(const char* method, double size) {
    if (!(size >= 0 && std::isfinite(size)))
        throw peru::CInvalidArgError(peru::format("size %f", size), method);
}

} // namespace

void CGraphicTable::SetColWidth(int col, double width) {
    checkSize("SetColWidth", width);
    GetCol(col).width = width;
    for (auto& line : m_cells) line[static_cast<size_t>(col)]->InvalidateLayout();
    DropHitMask();
}

void CGraphicTable::SetRowHeight(int row, double height) {
    checkSize("SetRowHeight", height);
    GetRow(row).height = height;
    DropHitMask();
}

void CGraphicTable::SetColVisible(int col, bool isVisible) {
    GetCol(col).isVisible = isVisible;
    DropHitMask();
}

void CGraphicTable::SetColHiddenByTheme(int col, bool isHidden) {
    GetCol(col).isHiddenByTheme = isHidden;
    DropHitMask();
}

void CGraphicTable::SetCellText(int row, int col, const P<CRichText>& text) {
    CCell& cell = GetCell(row, col);
    cell.text = text;
    cell.InvalidateLayout();
    DropHitMask();
}

void CGraphicTable::ClearCells() {
    for (auto& line : m_cells)
        for (auto& cell : line) {
            cell->text.reset();
            cell->InvalidateLayout();
        }
    DropHitMask();
}

bool CGraphicTable::HasText() const {
    return std::any_of(m_cells.begin(), m_cells.end(), [](const auto& line) {
        return std::any_of(line.begin(), line.end(),
                           [](const auto& cell) { return cell->text && hasText(*cell->text); });
    });
}

double CGraphicTable::GetTotalWidth() const {
    double width = 0;
    for (const auto& col : m_cols)
        if (col->isShown()) width += col->width;
    return width;
}

double CGraphicTable::GetTotalHeight() const {
    double height = 0;
    for (const auto& row : m_rows) height += row->height;
    return height;
}

} // namespace graphics

// The XML of tables.
#include "graphics/elements/GraphicTable.h"
#include "graphics/storage/IResourceStores.h"
#include "graphics/storage/XmlValues.h"
#include "peru/Errors.h"

namespace graphics {

namespace {

// Bounds the cells that a short file can ask for.
constexpr size_t kMaximalCells = 1'000'000;

} // namespace

void CGraphicTable::Save(const Node& node, IResourceOutputStore& store) const {
    CGraphicElement::Save(node, store);
    if (!m_rows.empty()) {
        const Node rows = addChild(node, "rows");
        for (const auto& row : m_rows) {
            const Node child = addChild(rows, "row");
            writeNumber(child, "height", row->height);
            writeAttribute(child, "content-id", row->contentId);
        }
    }
    if (!m_cols.empty()) {
        const Node cols = addChild(node, "cols");
        for (const auto& col : m_cols) {
            const Node child = addChild(cols, "col");
            writeNumber(child, "width", col->width);
            writeBool(child, "visible", col->isVisible);
            writeAttribute(child, "content-id", col->contentId);
            writeAttribute(child, "name", col->name);
            if (col->isHiddenByTheme) writeBool(child, "hidden-by-theme", true);
        }
    }
    if (m_rows.empty() || m_cols.empty()) return;
    const Node cells = addChild(node, "cells");
    for (const auto& row : m_cells)
        for (const auto& cell : row) {
            const Node child = addChild(cells, "cell");
            store.SaveRichText(child, "attachment-richtextbuffer", cell->text);
            writeNumber(child, "margin", cell->margin);
            writeAttribute(child, "content-id", cell->contentId);
            writeAttribute(child, "vertical-align", VerticalAlignToXml(cell->verticalAlign));
        }
}

void CGraphicTable::Load(const Node& node, IResourceInputStore& store) {
    CGraphicElement::Load(node, store);
    m_rows.clear();
    m_cols.clear();
    m_cells.clear();
    if (const Node rows = node->getChildNode("rows"))
        for (auto children = rows->getChildNodesByName("row"); children.hasMore();) {
            const Node child = children.getNext();
            m_rows.push_back(peru::make<CRow>());
            readNumber(child, "height", m_rows.back()->height);
            readAttribute(child, "content-id", m_rows.back()->contentId);
        }
    if (const Node cols = node->getChildNode("cols"))
        for (auto children = cols->getChildNodesByName("col"); children.hasMore();) {
            const Node child = children.getNext();
            const auto col = peru::make<CCol>();
            m_cols.push_back(col);
            readNumber(child, "width", col->width);
            readBool(child, "visible", col->isVisible);
            readAttribute(child, "content-id", col->contentId);
            readAttribute(child, "name", col->name);
            readBool(child, "hidden-by-theme", col->isHiddenByTheme);
        }
    if (m_rows.size() * m_cols.size() > kMaximalCells)
        throwInvalid(node, "cells", std::to_string(m_rows.size()));
    for (size_t row = 0; row < m_rows.size(); ++row) {
        auto& line = m_cells.emplace_back();
        for (size_t col = 0; col < m_cols.size(); ++col) line.push_back(peru::make<CCell>());
    }
    const Node cells = node->getChildNode("cells");
    if (!cells) return;
    // Rows and columns count; cells beyond them are dropped, and missing ones are empty.
    auto children = cells->getChildNodesByName("cell");
    for (auto& line : m_cells)
        for (auto& cell : line) {
            if (!children.hasMore()) return;
            const Node child = children.getNext();
            cell->text = store.LoadRichText(child, "attachment-richtextbuffer");
            readNumber(child, "margin", cell->margin);
            readAttribute(child, "content-id", cell->contentId);
            if (std::string align; readAttribute(child, "vertical-align", align))
                cell->verticalAlign = VerticalAlignFromXml(align);
        }
}

} // namespace graphics

#include "ced/GraphicTableContent.h"

#include "graphics/elements/CloneAs.h"
#include "graphics/text/RichTextParser.h"

namespace ced {

CGraphicTableContent::CGraphicTableContent() {
    SetTypeName(kTypeName);
}

P<graphics::CGraphicElement> CGraphicTableContent::Clone() const {
    return graphics::cloneAs(*this);
}

std::vector<int> CGraphicTableContent::resizeItemRows(int count) {
    std::vector<int> rows;
    for (int row = 0; row < GetRowCount(); ++row)
        if (GetRow(row).contentId.empty()) rows.push_back(row);
    while (static_cast<int>(rows.size()) > count) {
        DeleteRows(rows.back(), 1);
        rows.pop_back();
    }
    while (static_cast<int>(rows.size()) < count) {
        const int row = rows.empty() ? GetRowCount() : rows.back() + 1;
        InsertRows(row, 1);
        // The row before it is the model, not a row with headings behind it.
        if (!rows.empty()) {
            GetRow(row).height = GetRow(row - 1).height;
            for (int col = 0; col < GetColCount(); ++col) GetCell(row, col).copyFormat(GetCell(row - 1, col));
        }
        rows.push_back(row);
    }
    return rows;
}

void CGraphicTableContent::FillFromContent(int itemCount, const GetContentValue& getValue) {
    const std::vector<int> rows = resizeItemRows(std::max(1, itemCount));
    for (int item = 0; item < static_cast<int>(rows.size()); ++item)
        for (int col = 0; col < GetColCount(); ++col) {
            const std::string& id = GetCol(col).contentId;
            if (id.empty()) continue;
            const int row = rows[static_cast<size_t>(item)];
            SetCellText(row, col,
                        graphics::makeRichTextLike(GetCell(row, col).text,
                                                   item < itemCount ? getValue(id, item) : ""));
        }
}

P<graphics::CGraphicElement> CGraphicElementFactory::CreateElement(const std::string& typeName) {
    if (typeName == CGraphicTableContent::kTypeName) return peru::make<CGraphicTableContent>();
    return {};
}

} // namespace ced

// The table of contents of a disc.
#pragma once

#include "graphics/elements/ElementFactory.h"
#include "graphics/elements/GraphicTable.h"

#include <functional>

namespace ced {

using peru::P;

// A table that is filled from the content of a project.
class GRAPHICS_API CGraphicTableContent : public graphics::CGraphicTable {
public:
    static constexpr const char* kTypeName = "table-content";

    CGraphicTableContent();
    ~CGraphicTableContent() override = default;

    P<graphics::CGraphicElement> Clone() const override;

    // A value of an item, by the content id of a column.
    using GetContentValue = std::function<std::string(const std::string& contentId, int item)>;
    // Fills the columns that have a content id, one row for each item. Rows with a content id of their own,
    // such as the one with the headings, stay as they are. Missing rows are added with the format of the last
    // one, and those beyond the items are removed; without items, one empty row remains, so the format is not
    // lost.
    void FillFromContent(int itemCount, const GetContentValue& getValue);

private:
    // Removes or adds rows at the end of the item rows; returns the indices of the item rows.
    std::vector<int> resizeItemRows(int count);
};

// Creates the elements of this namespace that documents contain.
class GRAPHICS_API CGraphicElementFactory : public peru::CObject, public graphics::IGraphicElementFactory {
public:
    CGraphicElementFactory() = default;
    ~CGraphicElementFactory() override = default;

    P<graphics::CGraphicElement> CreateElement(const std::string& typeName) override;
};

} // namespace ced

// A grid of rich texts.
#pragma once

#include "graphics/elements/GraphicElement.h"
#include "graphics/elements/RichText.h"

namespace graphics {

class CLayoutCache;

enum class EVerticalAlign { top = 0, center = 1, bottom = 2 };

// "unknown" for an unknown value.
GRAPHICS_API std::string VerticalAlignToXml(EVerticalAlign align);
// Throws CError for an unknown text.
GRAPHICS_API EVerticalAlign VerticalAlignFromXml(std::string_view text);

// Every row has a cell for every column. Operations with an index outside of the table throw CInvalidArgError
// and leave the table unchanged.
class GRAPHICS_API CGraphicTable : public CGraphicElement {
public:
    // What a table consists of.
    class GRAPHICS_API CTableObject : public peru::CObject {
    protected:
        CTableObject() = default;
        ~CTableObject() override = default;

    public:
        // Marks what was computed for painting as stale.
        virtual void InvalidateLayout() {}
        virtual P<CTableObject> Clone() const = 0;
    };

    class GRAPHICS_API CRow : public CTableObject {
    public:
        CRow() = default;
        ~CRow() override = default;
        P<CTableObject> Clone() const override;

        double height = 5; // millimetres
        std::string contentId;
    };

    class GRAPHICS_API CCol : public CTableObject {
    public:
        CCol() = default;
        ~CCol() override = default;
        P<CTableObject> Clone() const override;

        bool isShown() const { return isVisible && !isHiddenByTheme; }
        // Localised, for a column at an index that counts from 1.
        std::string getLabel(int number) const;

        double width = 20; // millimetres
        bool isVisible = true;
        bool isHiddenByTheme = false;
        std::string contentId;
        std::string name;
    };

    class GRAPHICS_API CCell : public CTableObject {
    public:
        CCell();
        ~CCell() override;
        void InvalidateLayout() override { isLayoutStale = true; }
        P<CTableObject> Clone() const override;
        // Everything but the content: margin, alignment, and the style of the text.
        void copyFormat(const CCell& other);

        P<CRichText> text;   // may be empty
        double margin = 0.5; // millimetres, on each side
        EVerticalAlign verticalAlign = EVerticalAlign::top;
        std::string contentId;
        bool isLayoutStale = true;
        std::unique_ptr<CLayoutCache> layout; // of the last painting; may be null
    };

    CGraphicTable();
    ~CGraphicTable() override = default;

    bool HasResource() const override { return true; }
    std::string GetHint() const override;
    P<CGraphicElement> Clone() const override;
    void Assign(const CGraphicElement& other) override; // deep
    GraphicElementType GetType() const override { return GraphicElementType::table; }
    void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store) const override;
    void Load(const P<peru::IXmlNode>& node, IResourceInputStore& store) override;
    void Reset() override { ClearCells(); }

    int GetRowCount() const { return static_cast<int>(m_rows.size()); }
    int GetColCount() const { return static_cast<int>(m_cols.size()); }
    CRow& GetRow(int row) const;
    CCol& GetCol(int col) const;
    CCell& GetCell(int row, int col) const;

    // Before the row at the index, or at the end. New rows have the height and format of the row that was
    // there, otherwise of the last one. Columns likewise.
    void InsertRows(int row, int count);
    void InsertCols(int col, int count);
    void DeleteRows(int row, int count);
    void DeleteCols(int col, int count);
    void ExchangeRows(int first, int second);
    void ExchangeCols(int first, int second);
    // Sizes below 0 throw CInvalidArgError.
    void SetColWidth(int col, double width);
    void SetRowHeight(int row, double height);
    void SetColVisible(int col, bool isVisible);
    // A column that a theme hides keeps its width and its own visibility.
    void SetColHiddenByTheme(int col, bool isHidden);
    void SetCellText(int row, int col, const P<CRichText>& text);
    // Drops the texts; the format remains.
    void ClearCells();

    // Whether a cell has a character or an image.
    bool HasText() const;
    // Of the visible columns and of the rows, in millimetres, before they are scaled to the box.
    double GetTotalWidth() const;
    double GetTotalHeight() const;

protected:
    void PaintContent(CPaintContext& context) const override;

private:
    void checkRange(const char* method, int index, int count, int size) const;

    std::vector<P<CRow>> m_rows;
    std::vector<P<CCol>> m_cols;
    std::vector<std::vector<P<CCell>>> m_cells; // rows by columns
};

} // namespace graphics

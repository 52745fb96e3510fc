// An ordered list of elements.
#pragma once

#include "graphics/documents/XData.h"
#include "graphics/elements/GraphicElement.h"

#include <functional>
#include <optional>

namespace graphics {

// Selects the elements that take part in an operation.
using GraphicFilter = std::function<bool(const CGraphicElement&)>;

// The first element is painted first, at the bottom. Interface thread only.
class GRAPHICS_API CGraphicContainer : public IGraphicListener {
public:
    CGraphicContainer() = default;
    ~CGraphicContainer() override;
    CGraphicContainer(const CGraphicContainer&) = delete;
    CGraphicContainer& operator=(const CGraphicContainer&) = delete;

    void OnGraphicChanged(CGraphicBase& element) override;
    // Between the two, the bounding box remains as it is. Calls may be nested.
    virtual void BeginUpdate();
    virtual void EndUpdate();
    // Computes the smallest upright box around the rotated rectangles of all elements.
    virtual void UpdateBoundingBox();
    // Removes all elements and the content box.
    virtual void Clear();
    // Paints the visible elements, first to last. The second form leaves out those that the filter rejects.
    virtual void PaintElements(CPaintContext& context) const;
    void PaintElements(CPaintContext& context, const GraphicFilter& filter) const;

    int GetUpdateCount() const { return m_updateCount; }
    // Recomputed if an element has changed, unless an update is in progress. Empty without elements.
    const SRect& GetBoundingBox();
    const std::optional<SRect>& GetContentBox() const { return m_contentBox; }
    void SetContentBox(const std::optional<SRect>& box) { m_contentBox = box; }
    const P<CXDatas>& GetXDatas() const { return m_xdatas; } // may be empty
    void SetXDatas(const P<CXDatas>& datas) { m_xdatas = datas; }

    int GetCount() const { return static_cast<int>(m_elements.size()); }
    // Throws CInvalidArgError for an index outside of the list, as the operations below do.
    const P<CGraphicElement>& GetElement(int index) const;
    const std::vector<P<CGraphicElement>>& GetElements() const { return m_elements; }
    // At the top. An element may be in several containers, but only once in each: another addition throws
    // CInvalidArgError, as an empty handle does.
    void Add(const P<CGraphicElement>& element);
    void Insert(int index, const P<CGraphicElement>& element); // at most the count
    // Returns false if the element is not in the list.
    bool Remove(const P<CGraphicElement>& element);
    // -1 if the element is not in the list.
    int IndexOf(const P<CGraphicElement>& element) const;
    void MoveToTop(const P<CGraphicElement>& element);
    void MoveToBottom(const P<CGraphicElement>& element);

    // The topmost visible element whose rectangle contains the point; empty if there is none.
    P<CGraphicElement> FindAt(double x, double y) const;

protected:
    void InvalidateBoundingBox() { m_isBoundingBoxValid = false; }

private:
    void Move(const P<CGraphicElement>& element, int index);

    std::vector<P<CGraphicElement>> m_elements;
    int32_t m_updateCount = 0;
    bool m_isBoundingBoxValid = true;
    SRect m_boundingBox;
    std::optional<SRect> m_contentBox;
    P<CXDatas> m_xdatas;
};

} // namespace graphics

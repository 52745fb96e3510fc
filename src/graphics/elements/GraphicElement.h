// One element of a design.
#pragma once

#include "graphics/elements/GraphicBase.h"
#include "graphics/elements/GraphicElementType.h"
#include "graphics/geometry/Polygon.h"

#include <set>

namespace graphics {

// Elements are shared by reference; a document listens to each of its elements.
class GRAPHICS_API CGraphicElement : public CGraphicBase {
protected:
    CGraphicElement();
    ~CGraphicElement() override;

public:
    // The name, or the localised name of the type.
    std::string GetDisplayName() const override;

    // Above 0, different for each element of the process.
    int64_t GetUnique() const { return m_unique; }

    virtual std::string GetHint() const;
    // Whether a point of model space lies in the rotated rectangle; the edges belong to it.
    virtual bool ContainsPoint(double x, double y) const;
    // A deep copy with a unique value of its own and without listeners.
    virtual P<CGraphicElement> Clone() const = 0;
    // Copies the common fields; each class adds its own, provided that the other element has its class.
    virtual void Assign(const CGraphicElement& other);
    virtual GraphicElementType GetType() const = 0;
    // The name that an IGraphicElementFactory knows; empty for the classes of this module.
    virtual std::string GetTypeName() const;
    virtual void SetColoured(bool isColoured);
    virtual bool IsColoured() const;
    virtual void SetHintText(const std::string& hint);
    // Drops content that came from outside, such as an image.
    virtual void Reset();
    // Symmetric. Compares circles, rectangles and shapes by their outlines; false for all other pairs.
    virtual bool Intersects(const CGraphicElement& other) const;
    // The outline in model space that Intersects() compares; by default the rotated rectangle.
    virtual Polygon GetOutline() const;
    // How far painting reaches beyond the rectangle, in millimetres.
    virtual double GetOverhang() const;

    const std::set<std::string>& GetTags() const { return m_tags; }
    bool HasTag(const std::string& tag) const { return m_tags.count(tag) != 0; }
    void AddTag(const std::string& tag) { m_tags.insert(tag); }
    void RemoveTag(const std::string& tag) { m_tags.erase(tag); }
    void ClearTags() { m_tags.clear(); }

    const std::set<int32_t>& GetGroups() const { return m_groups; }
    // Numbers of 0 and below are ignored.
    void AddGroup(int32_t group);
    void RemoveGroup(int32_t group) { m_groups.erase(group); }
    void ClearGroups() { m_groups.clear(); }
    bool SharesGroupWith(const CGraphicElement& other) const;

    // Whether the user has changed the element since a template filled it.
    bool IsModified() const { return m_isModified; }
    void SetModified(bool isModified) { m_isModified = isModified; }
    const std::string& GetContentId() const { return m_contentId; }
    void SetContentId(const std::string& id) { m_contentId = id; }
    int32_t GetContentIndex() const { return m_contentIndex; }
    void SetContentIndex(int32_t index) { m_contentIndex = index; }
    const std::string& GetTextId() const { return m_textId; }
    void SetTextId(const std::string& id) { m_textId = id; }
    const std::string& GetHintText() const { return m_hintText; }

protected:
    // From local coordinates to model space, mirrors included.
    CMatrix GetContentMatrix() const;
    // The rectangle in local coordinates, around the origin.
    SRect GetLocalRect() const { return SRect::fromCenter({}, GetSize()); }

private:
    std::set<std::string> m_tags;
    std::set<int32_t> m_groups; // all above 0
    bool m_isColoured = true;
    bool m_isModified = false;
    std::string m_contentId;
    int32_t m_contentIndex = 0;
    std::string m_textId;
    std::string m_hintText;
    const int64_t m_unique;
};

} // namespace graphics

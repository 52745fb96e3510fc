// One element of a design.
#pragma once

#include "graphics/elements/GraphicBase.h"
#include "graphics/elements/GraphicElementType.h"
#include "graphics/elements/HitMask.h"
#include "graphics/geometry/Polygon.h"
#include "graphics/storage/IReusableResource.h"

#include <memory>
#include <set>

namespace graphics {

// Elements are shared by reference; a document listens to each of its elements.
class GRAPHICS_API CGraphicElement : public CGraphicBase, public virtual IReusableResource {
protected:
    CGraphicElement();
    ~CGraphicElement() override;

public:
    // The name, or the localised name of the type.
    std::string GetDisplayName() const override;

    void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store) const override;
    // Attributes that the node lacks leave their fields unchanged; tags and groups are replaced.
    void Load(const P<peru::IXmlNode>& node, IResourceInputStore& store) override;
    int64_t GetUnique() const override { return m_unique; }

    void SetMirrored(EAxis axis, bool isMirrored) override;
    // Applies placement, mirrors and colour, then paints the content. Elements that cannot be seen cost
    // little.
    void Paint(CPaintContext& context) const override;

    virtual std::string GetHint() const;
    // Whether a point of model space lies in the rotated rectangle; the edges belong to it.
    virtual bool ContainsPoint(double x, double y) const;
    // Paints the element's alpha for a transform from model space to pixels, unless the mask at hand was made
    // for the same box. Throws CError if the box has more than 100 million pixels.
    virtual void UpdateHitMask(const CMatrix& matrix);
    // A deep copy with a unique value of its own and without listeners.
    virtual P<CGraphicElement> Clone() const = 0;
    // Copies the common fields; each class adds its own, provided that the other element has its class.
    virtual void Assign(const CGraphicElement& other);
    virtual GraphicElementType GetType() const = 0;
    // The name that an IGraphicElementFactory knows; by default empty, or the name that a file has for an
    // element of a class that this program does not know.
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
    void SetTypeName(const std::string& name) { m_typeName = name; }
    const std::string& GetTextId() const { return m_textId; }
    void SetTextId(const std::string& id) { m_textId = id; }
    const std::string& GetHintText() const { return m_hintText; }

    // Null before UpdateHitMask().
    const SHitMask* GetHitMask() const { return m_hitMask.get(); }
    void DropHitMask() { m_hitMask.reset(); }

protected:
    void NotifyChanged() override;
    // In local coordinates: the origin is the center.
    virtual void PaintContent(CPaintContext& context) const;
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
    std::string m_typeName;
    std::unique_ptr<SHitMask> m_hitMask;
    const int64_t m_unique;
};

} // namespace graphics

// The geometry that elements of a design and the editor's controls share.
#pragma once

#include "graphics/elements/IGraphicListener.h"
#include "graphics/geometry/Matrix.h"
#include "peru/P.h"

#include <cstdint>
#include <string>
#include <vector>

namespace graphics {

using peru::P;

class CPaintContext;

// Bits of the flag word. Bits without a name are preserved for the editor.
enum EGraphicFlag : uint32_t {
    kFlagSelectable = 1,
    kFlagLocked = 2,         // position and size are fixed in the editor
    kFlagAlternateStyle = 4, // the editor paints the element in its second style
    kFlagEditable = 16,      // a double click opens the element's dialog
    kFlagStyled = 32,        // has a brush and a pen of its own that the user may change
};

enum class EAxis { x = 0, y = 1 };

// A rectangle with a center, a size and a rotation. Lengths are millimetres, texts UTF-8. The order of the
// virtual operations is fixed. Interface thread only.
class GRAPHICS_API CGraphicBase : public peru::CObject {
protected:
    CGraphicBase() = default;
    ~CGraphicBase() override = default;

public:
    CGraphicBase(const CGraphicBase&) = delete;
    CGraphicBase& operator=(const CGraphicBase&) = delete;

    virtual std::string GetName() const;
    virtual std::string GetDisplayName() const;
    // Of the rectangle before rotation.
    virtual SPoint GetTopLeft() const;
    virtual void SetTopLeft(double x, double y);
    virtual SPoint GetCenter() const;
    virtual void SetCenter(double x, double y);
    virtual SSize GetSize() const;
    virtual void SetSize(double width, double height);
    // Changes the size so that the rotated rectangle fills the given upright box. Exact if the rotation is a
    // multiple of 90 degrees; otherwise an approximation whose sides are at least 1 mm.
    virtual void SetBoundingSize(double width, double height);
    // The smallest upright box around the rotated rectangle.
    virtual SSize GetBoundingSize() const;
    // Truncated to whole degrees from 0 to 359.
    virtual void SetRotation(double degrees);
    virtual double GetRotation() const;
    virtual void SetMirrored(EAxis axis, bool isMirrored);
    virtual bool IsMirrored(EAxis axis) const;
    // Ignores the rotation.
    virtual SRect GetRect() const;
    // From the unit box (0, 0) to (1, 1) to the rotated rectangle.
    virtual CMatrix GetBoxMatrix() const;
    // From local coordinates, which have the center as their origin, to model space.
    virtual CMatrix GetPlacementMatrix() const;
    virtual void Paint(CPaintContext& context) const;
    virtual void SetFlags(uint32_t flags);
    virtual uint32_t GetFlags() const;
    virtual bool IsLocked() const;
    virtual void SetLocked(bool isLocked);
    // The number of a mouse cursor, or -1 for the default one.
    virtual int GetCursor() const;
    // True for elements that own a resource to reload.
    virtual bool HasResource() const;
    // True if two points define the geometry instead of a box, so that the editor offers handles for them.
    virtual bool IsDefinedByPoints() const;

    void SetName(const std::string& name) { m_name = name; }
    bool IsVisible() const { return m_isVisible; }
    void SetVisible(bool isVisible) { m_isVisible = isVisible; }
    bool HasFlag(EGraphicFlag flag) const { return (GetFlags() & flag) != 0; }
    // The upright box around the rotated rectangle, in model space.
    SRect GetBoundingBox() const;

    // The listener is not referenced; adding it twice notifies it twice.
    void AddListener(IGraphicListener* listener);
    // Removes one entry. Removing an absent listener does nothing.
    void RemoveListener(IGraphicListener* listener);
    bool HasListener(const IGraphicListener* listener) const;

protected:
    virtual void NotifyChanged();
    // Everything but the listeners. Notifies.
    void AssignBase(const CGraphicBase& other);

private:
    std::vector<IGraphicListener*> m_listeners; // not owned
    SPoint m_center;
    SSize m_size;
    std::string m_name;
    double m_rotation = 0; // whole degrees, 0 to 359
    uint32_t m_flags = kFlagSelectable;
    bool m_isMirrored[2] = {false, false};
    bool m_isVisible = true;
};

} // namespace graphics

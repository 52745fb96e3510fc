// The calls that all painting is made of.
#pragma once

#include "graphics/elements/Appearance.h"
#include "graphics/images/Bitmap.h"
#include "graphics/painting/Path.h"

namespace graphics {

class CTextLayout;

// What becomes of colours before they are painted.
enum class EEffect {
    none,
    grey, // the luminance
    mask, // (a, a, a, 255), a being the colour's alpha: the picture is the transparency of what would be
          // painted
};

// A brush, or a gradient from the top to the bottom of a box in the coordinates of the path.
struct SFill {
    SBrush brush;
    SGradient gradient;
    SRect gradientBox;
};

// Coordinates are transformed by the current matrix, line widths included. An error of the device, such as a
// lack of memory, is reported when the picture is finished.
class GRAPHICS_API IGraphicsContext : public virtual peru::IBase {
protected:
    ~IGraphicsContext() override = default;

public:
    virtual void SetMatrix(const CMatrix& matrix) = 0;
    virtual void SetEffect(EEffect effect) = 0;
    virtual EEffect GetEffect() const = 0;
    // Null leaves the fill or the line out. Without anything visible nothing is painted.
    virtual void DrawPath(const CPath& path, const SFill* fill, const SPen* pen) = 0;
    // Stretches a part of the bitmap, in whole pixels, to the target.
    virtual void DrawBitmap(const CBitmap& bitmap, const SRect& source, const SRect& target) = 0;
    // The origin is the layout's top left corner. The layout's colours are painted as they are.
    virtual void DrawLayout(const CTextLayout& layout, SPoint origin) = 0;
    // Restricts painting to a rectangle, until the matching PopClip().
    virtual void PushClip(const SRect& rect) = 0;
    virtual void PopClip() = 0;
    // What can be painted on, in device units.
    virtual SRect GetClipBox() const = 0;
    // Pixels per device unit that pictures of pixels should have: 1 for a bitmap.
    virtual double GetResolution() const = 0;
};

} // namespace graphics

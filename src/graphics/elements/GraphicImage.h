// A picture.
#pragma once

#include "graphics/elements/GraphicElement.h"
#include "graphics/elements/ScaleMargins.h"
#include "graphics/images/ResourceBuffer.h"

namespace graphics {

class GRAPHICS_API CGraphicImage : public CGraphicElement {
public:
    CGraphicImage();
    ~CGraphicImage() override = default;

    bool HasResource() const override { return true; }
    P<CGraphicElement> Clone() const override; // shares the bitmap
    void Assign(const CGraphicElement& other) override;
    GraphicElementType GetType() const override { return GraphicElementType::image; }
    void Save(const P<peru::IXmlNode>& node, IResourceOutputStore& store) const override;
    void Load(const P<peru::IXmlNode>& node, IResourceInputStore& store) override;
    void Reset() override;
    void SetRotation(double degrees) override;
    void SetMirrored(EAxis axis, bool isMirrored) override;
    void SetColoured(bool isColoured) override;

    const P<CBitmap>& GetBitmap() const { return m_bitmap.Get(); } // may be empty
    void SetBitmap(const P<CBitmap>& bitmap);
    // A path, or empty for an image that does not come from a file.
    const std::string& GetFileName() const { return m_fileName; }
    void SetFileName(const std::string& fileName) { m_fileName = fileName; }
    const SScaleMargins& GetScaleMargins() const { return m_scaleMargins; }
    void SetScaleMargins(const SScaleMargins& margins);
    // Paints the bitmap centered at 96 dpi instead of filling the box.
    bool IsNoScale() const { return m_isNoScale; }
    void SetNoScale(bool isNoScale);

protected:
    void PaintContent(CPaintContext& context) const override;

private:
    // With its strips stretched if there are margins; in the size of the device's pixels if it is much larger
    // and fills the box.
    P<CBitmap> getPaintedBitmap(const CPaintContext& context) const;

    TResourceBuffer<CBitmap> m_bitmap;
    std::string m_fileName;
    SScaleMargins m_scaleMargins;
    bool m_isNoScale = false;
};

} // namespace graphics

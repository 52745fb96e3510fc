#include "graphics/images/Bitmap.h"

#include "graphics/images/BitmapCache.h"
#include "graphics/images/ImageCodec.h"
#include "graphics/images/ScaledImage.h"
#include "peru/Errors.h"
#include "peru/log/LogManager.h"
#include "peru/strings/IStringLocalizer.h"

namespace graphics {

CBitmap::CBitmap(int width, int height, std::vector<uint32_t> pixels)
    : CBitmap(std::make_shared<peru::gui::CPremultipliedImage>(width, height, std::move(pixels))) {}

CBitmap::CBitmap(CPixels::Image image)
    : m_size{image->getWidth(), image->getHeight()}, m_image(std::move(image)) {}

CBitmap::CBitmap(EBitmapFormat format, std::string bytes)
    : m_size(probeImage(format, bytes)), m_format(format), m_bytes(std::move(bytes)) {}

CBitmap::~CBitmap() {
    getBitmapCache().Drop(this);
}

CPixels CBitmap::GetPixels() const {
    if (m_image) return CPixels(m_image);
    CBitmapCache& cache = getBitmapCache();
    CPixels::Image image = cache.Find({this, m_size.width, m_size.height});
    if (!image) {
        image = decode();
        cache.Add({this, m_size.width, m_size.height}, image);
    }
    return CPixels(std::move(image));
}

CPixels::Image CBitmap::decode() const {
    if (!m_isDamaged) {
        try {
            return std::make_shared<peru::gui::CPremultipliedImage>(decodeImage(m_format, m_bytes, m_size));
        } catch (const peru::CException& error) {
            m_isDamaged = true;
            peru::getLogManager()->warning(peru::CString::fromUTF8("graphics"), error.getDescription());
        }
    }
    return std::make_shared<peru::gui::CPremultipliedImage>(m_size.width, m_size.height);
}

P<CBitmap> CBitmap::GetVersion(SPixelSize size) const {
    if (size.width < 1 || size.height < 1) throw peru::CInvalidArgError("size", "GetVersion");
    if (size == m_size) return peru::make<CBitmap>(GetPixels().GetImage());
    CBitmapCache& cache = getBitmapCache();
    CPixels::Image image = cache.Find({this, size.width, size.height});
    if (!image) {
        image = std::make_shared<peru::gui::CPremultipliedImage>(scaleImage(*GetPixels().GetImage(), size));
        cache.Add({this, size.width, size.height}, image);
    }
    return peru::make<CBitmap>(std::move(image));
}

void CBitmap::DropVersions() const {
    getBitmapCache().DropOthers({this, m_size.width, m_size.height});
}

bool CBitmap::HasAlpha() const {
    if (!m_hasAlpha) m_hasAlpha = probeAlpha(m_format, m_bytes);
    if (!m_hasAlpha) m_hasAlpha = !GetPixels().GetImage()->isOpaque();
    return *m_hasAlpha;
}

std::string CBitmap::Encode(EBitmapFormat format) const {
    if (format == m_format) return m_bytes;
    const CPixels pixels = GetPixels();
    if (m_isDamaged)
        throw peru::CError(peru::localize("graphics.CBitmap.Damaged",
                                          "The picture is damaged and cannot be stored in another format."));
    return encodeImage(format, *pixels.GetImage());
}

} // namespace graphics

// Pictures of pixels.
#pragma once

#include "graphics/Api.h"
#include "peru/Object.h"
#include "peru/gui/ImageLimits.h"
#include "peru/gui/RGBAImage.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace graphics {

using peru::P;

// The numbers are those of wxWidgets.
enum class EBitmapFormat {
    none = 0,
    bmp = 1,
    ico = 3,
    tif = 11,
    gif = 13,
    png = 15,
    jpg = 17,
    jng = 1050,
    mng = 1051
};

inline constexpr int64_t kMaximalPixels = peru::gui::kDefaultMaximalPixels;

struct SPixelSize {
    int width;
    int height;

    bool operator==(const SPixelSize&) const = default;
};

// The pixels of a bitmap, premultiplied, which stay in memory as long as this object exists.
class CPixels {
public:
    using Image = std::shared_ptr<const peru::gui::CPremultipliedImage>;

    explicit CPixels(Image image) : m_image(std::move(image)) {}

    const Image& GetImage() const { return m_image; }
    operator const std::vector<uint32_t>&() const {
        return m_image->getPixels();
    } // NOLINT: behaves as pixels
    // Not of a temporary object, which releases the pixels at the end of the expression.
    const uint32_t* data() const& { return m_image->getPixels().data(); }
    const uint32_t* data() && = delete;
    size_t size() const { return m_image->getPixels().size(); }
    uint32_t operator[](size_t index) const { return m_image->getPixels()[index]; }
    auto begin() const { return m_image->getPixels().begin(); }
    auto end() const { return m_image->getPixels().end(); }
    bool operator==(const CPixels& other) const { return *m_image == *other.m_image; }
    bool operator==(const std::vector<uint32_t>& pixels) const { return m_image->getPixels() == pixels; }

private:
    Image m_image;
};

// Immutable, so elements share it. Interface thread only.
class GRAPHICS_API CBitmap : public peru::CObject {
public:
    // Premultiplied ARGB. Throws CInvalidArgError if the number of pixels does not fit the size.
    CBitmap(int width, int height, std::vector<uint32_t> pixels);
    explicit CBitmap(CPixels::Image image);
    // From the bytes of a file, which are decoded when the pixels are needed, and stored as they are when the
    // bitmap is saved in the same format. Throws CError if the format is unknown or the size above the limit.
    CBitmap(EBitmapFormat format, std::string bytes);
    ~CBitmap() override;

    int GetWidth() const { return m_size.width; }
    int GetHeight() const { return m_size.height; }
    // All transparent if the bytes are damaged. Decoded pixels are kept within the limit of memory of all
    // bitmaps (getImageMemory()), and decoded again after they were released.
    CPixels GetPixels() const;
    // The bitmap stretched to another size, kept within the same limit. Throws CInvalidArgError if a side is
    // below 1.
    P<CBitmap> GetVersion(SPixelSize size) const;
    // Releases all versions.
    void DropVersions() const;
    // True if a pixel may not be opaque.
    bool HasAlpha() const;
    // The content of a file. Throws CError if the format cannot be written, or if the bytes are damaged and
    // the format is another one.
    std::string Encode(EBitmapFormat format) const;

private:
    CPixels::Image decode() const;

    SPixelSize m_size = {0, 0};
    const EBitmapFormat m_format = EBitmapFormat::none;
    const std::string m_bytes;
    const CPixels::Image m_image; // of a bitmap without bytes
    mutable bool m_isDamaged = false;
    mutable std::optional<bool> m_hasAlpha;
};

} // namespace graphics

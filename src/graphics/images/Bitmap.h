// Pictures of pixels.
#pragma once

#include "graphics/Api.h"
#include "peru/Object.h"

#include <cstdint>
#include <string>
#include <vector>

namespace graphics {

using peru::P;

// The numbers are those of wxWidgets.
enum class EBitmapFormat { none = 0, bmp = 1, ico = 3, png = 15, jpg = 17, jng = 1050 };

// The limit on the pixels of one picture, checked before memory is allocated.
inline constexpr int64_t kMaximalPixels = 100'000'000;

// Premultiplied ARGB, 32 bits for each pixel, row by row from the top. Immutable, so elements share it.
// Interface thread only.
class GRAPHICS_API CBitmap : public peru::CObject {
public:
    // Throws CInvalidArgError if the number of pixels does not fit the size.
    CBitmap(int width, int height, std::vector<uint32_t> pixels);
    // From the bytes of a file, which are decoded when the pixels are first needed, and stored as they are
    // when the bitmap is saved in the same format. Throws CError if the format is unknown or the size above
    // the limit.
    CBitmap(EBitmapFormat format, std::string bytes);
    ~CBitmap() override = default;

    int GetWidth() const { return m_width; }
    int GetHeight() const { return m_height; }
    // All transparent if the bytes are damaged.
    const std::vector<uint32_t>& GetPixels() const;
    // True if a pixel may not be opaque.
    bool HasAlpha() const;
    // The content of a file. Throws CError if the format cannot be written.
    std::string Encode(EBitmapFormat format) const;

private:
    int m_width = 0;
    int m_height = 0;
    const EBitmapFormat m_format = EBitmapFormat::none;
    const std::string m_bytes;
    mutable std::vector<uint32_t> m_pixels; // empty until they are needed
};

} // namespace graphics

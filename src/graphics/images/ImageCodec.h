// Files of pictures.
#pragma once

#include "graphics/images/Bitmap.h"

namespace graphics {

struct SPixelSize {
    int width;
    int height;

    bool operator==(const SPixelSize&) const = default;
};

// By the ending of a file name without regard to case; none if it is unknown.
GRAPHICS_API EBitmapFormat getFormatOfFile(const std::string& fileName);
// "png" and so on; empty for none.
GRAPHICS_API std::string getExtension(EBitmapFormat format);

// From the header alone. Throws CError if there is none, or if the picture has more than kMaximalPixels.
GRAPHICS_API SPixelSize probeImage(EBitmapFormat format, const std::string& bytes);
// Premultiplied pixels. Throws CError if the bytes are damaged or do not have the size.
GRAPHICS_API std::vector<uint32_t> decodeImage(EBitmapFormat format, const std::string& bytes,
                                               SPixelSize size);
// Throws CError. JPEG drops the alpha.
GRAPHICS_API std::string encodeImage(EBitmapFormat format, const std::vector<uint32_t>& pixels,
                                     SPixelSize size);

} // namespace graphics

// Files of pictures.
#pragma once

#include "graphics/images/Bitmap.h"

#include <string_view>

namespace graphics {

// By the ending of a file name without regard to case; none if it is not that of a format in which bitmaps
// are stored: BMP, ICO, PNG, JPEG and JNG.
GRAPHICS_API EBitmapFormat getFormatOfFile(const std::string& fileName);
// By the content, for all formats that can be read; none if it is unknown.
GRAPHICS_API EBitmapFormat detectFormat(std::string_view bytes);
// "png" and so on; empty for none.
GRAPHICS_API std::string getExtension(EBitmapFormat format);

// From the header alone. Throws CError if there is none, or if the picture is above the limit of pixels.
GRAPHICS_API SPixelSize probeImage(EBitmapFormat format, const std::string& bytes);
// Whether the header announces an alpha channel; empty if only the pixels can tell.
GRAPHICS_API std::optional<bool> probeAlpha(EBitmapFormat format, std::string_view bytes);
// The first frame of an animation, the first page of a TIFF file, the largest picture of an icon. Throws
// CError if the bytes are damaged or do not have the size.
GRAPHICS_API peru::gui::CPremultipliedImage decodeImage(EBitmapFormat format, const std::string& bytes,
                                                        SPixelSize size);
// Throws CError. JPEG drops the alpha.
GRAPHICS_API std::string encodeImage(EBitmapFormat format, const peru::gui::CPremultipliedImage& image);

} // namespace graphics

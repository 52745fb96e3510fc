// The toolkit's interface to the two formats.
#pragma once

#include "graphics/Api.h"

#include <wx/image.h>

namespace wxjng {

// Values of wxBitmapType that the toolkit does not define. They are numbers, since a sanitizer rejects
// variables of that type with other values than its own.
inline constexpr int kJngType = 1050;
inline constexpr int kMngType = 1051;

// Options of an image for writing JNG, beside wxIMAGE_OPTION_QUALITY: the compression of the alpha channel, 0
// without loss (the default) or 8 as JPEG.
inline constexpr const char* kOptionAlphaCompression = "JngAlphaCompression";

class GRAPHICS_API CJngHandler : public wxImageHandler {
public:
    CJngHandler();
    bool LoadFile(wxImage* image, wxInputStream& stream, bool isVerbose, int index) override;
    bool SaveFile(wxImage* image, wxOutputStream& stream, bool isVerbose) override;

protected:
    bool DoCanRead(wxInputStream& stream) override;
};

// Reads the frame with the given index, by default the first one. Writes a picture of one frame.
class GRAPHICS_API CMngHandler : public wxImageHandler {
public:
    CMngHandler();
    bool LoadFile(wxImage* image, wxInputStream& stream, bool isVerbose, int index) override;
    bool SaveFile(wxImage* image, wxOutputStream& stream, bool isVerbose) override;

protected:
    bool DoCanRead(wxInputStream& stream) override;
    int DoGetImageCount(wxInputStream& stream) override;
};

} // namespace wxjng

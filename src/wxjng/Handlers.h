// The toolkit's interface to the two formats.
#pragma once

#include "graphics/Api.h"

#include <wx/image.h>

namespace wxjng {

inline constexpr auto kJngType = static_cast<wxBitmapType>(1050);
inline constexpr auto kMngType = static_cast<wxBitmapType>(1051);

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

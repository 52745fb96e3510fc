// The toolkit's interface to GIF files.
#pragma once

#include <wx/image.h>

namespace graphics::animation {

// Stands in for the toolkit's own handler, whose decoder writes outside of its memory for damaged files.
// Reads the frame with the given index as it is shown, by default the first one. Writing is not supported.
class CGifHandler : public wxImageHandler {
public:
    CGifHandler();
    bool LoadFile(wxImage* image, wxInputStream& stream, bool isVerbose, int index) override;

protected:
    bool DoCanRead(wxInputStream& stream) override;
    int DoGetImageCount(wxInputStream& stream) override;
};

} // namespace graphics::animation

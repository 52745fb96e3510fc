// Designs on the clipboard.
#pragma once

#include "graphics/documents/GraphicDocument.h"

#include <wx/dataobj.h>

namespace graphics {

// An archive in memory. Needs no display; the clipboard that takes or fills it does.
class GRAPHICS_API CDataObjectGraphicDocument : public wxCustomDataObject {
public:
    // Empty, to be filled by the clipboard.
    CDataObjectGraphicDocument();
    // With the design. Throws CError.
    explicit CDataObjectGraphicDocument(const P<CGraphicDocument>& document);

    // A new document. Throws CError if the data are not those of a design.
    P<CGraphicDocument> GetDocument() const;
};

} // namespace graphics

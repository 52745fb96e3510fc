// Rich text as the toolkit's buffers.
//
// Elements hold the XML that wxRichTextXMLHandler reads and writes (CRichText) and not a buffer: documents
// can be loaded, painted and saved without a running toolkit, what the toolkit does not know remains in the
// file, and clones share their text. An editor takes a buffer from an element, edits it, and stores it back.
// Texts that are not edited are never converted.
#pragma once

#include "graphics/elements/RichText.h"

#include <memory>

class wxRichTextBuffer;

namespace graphics {

// A buffer with the text. Throws CParseError if the XML is damaged.
GRAPHICS_API std::unique_ptr<wxRichTextBuffer> toRichTextBuffer(const CRichText& text);
// The text of a buffer, for an element. Throws CError.
GRAPHICS_API P<CRichText> fromRichTextBuffer(wxRichTextBuffer& buffer);

} // namespace graphics

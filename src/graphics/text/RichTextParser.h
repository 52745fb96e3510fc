// The paragraphs of a rich text.
#pragma once

#include "graphics/elements/RichText.h"
#include "graphics/text/Paragraph.h"

namespace graphics {

// The content of text boxes and tables follows as paragraphs of its own. Text that cannot be read has no
// paragraphs, and an image that cannot be decoded is left out; both are logged.
GRAPHICS_API std::vector<SParagraph> parseRichText(const CRichText& text);
// Whether there is a character or an image.
GRAPHICS_API bool hasText(const CRichText& text);
// The other way, for texts that a program fills in. Each line becomes a paragraph.
GRAPHICS_API P<CRichText> makeRichText(const std::string& plainText, const SFont& font,
                                       const SColour& colour = {},
                                       ETextAlignment alignment = ETextAlignment::left);
// Other text in the style of an existing one: that of its first paragraph and of the first text in it. Each
// line becomes a paragraph. Without a model, or with one that cannot be read, the style is the default.
GRAPHICS_API P<CRichText> makeRichTextLike(const P<CRichText>& model, const std::string& plainText);

} // namespace graphics

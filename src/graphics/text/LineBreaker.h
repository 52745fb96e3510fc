// Where text is broken into lines.
#pragma once

#include "graphics/text/PangoLayouts.h"

namespace graphics {

// Breaks a text without line breaks at blanks and tabs, by the rule of the toolkit's rich text: the blank
// behind a word has to fit as well, and text without a blank is broken between characters. Returns the offset
// of the end of each line. `layout` has the whole text in one line; widths are units. `tabs` are ascending
// stops from the start of a line.
std::vector<size_t> breakLines(PangoLayout* layout, double firstWidth, double otherWidth,
                               const std::vector<double>& tabs);

} // namespace graphics

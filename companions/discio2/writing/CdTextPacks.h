// CD-TEXT as it is stored on a disc.
#pragma once

#include "Medium.h"

namespace discio {

// Packs of 18 bytes, for the lead-in or a .cdt file; empty if there are no texts. Throws CDiscError with
// DISCIO_ERROR_NOT_SUPPORTED if a text is not Latin-1, or if they are too long together.
std::string makeTextPacks(const STableOfContents& contents);

} // namespace discio

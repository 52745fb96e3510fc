// CD-TEXT.
#pragma once

#include "Medium.h"

#include <string_view>

struct cdtext_s;

namespace discio {

// Adds the texts of the first language in packs of 18 bytes, which may follow a header of 4 bytes. Texts that
// are known already are replaced. Packs that are damaged are ignored.
void addCdText(std::string_view packs, STableOfContents& contents);
// The same for packs that libcdio has read; null for none.
void addCdText(const cdtext_s* texts, STableOfContents& contents);

} // namespace discio

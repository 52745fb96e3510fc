// Treats arbitrary bytes as the packs of CD-TEXT.
#include "CdText.h"

using namespace discio;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    STableOfContents contents;
    for (int number = 1; number <= 3; ++number) {
        contents.tracks.emplace_back();
        contents.tracks.back().number = number;
    }
    addCdText({reinterpret_cast<const char*>(data), size}, contents);
    return 0;
}

// Arbitrary text as rich text, broken into lines.
#include "../../tests/support/FontLeaks.h"
#include "graphics/text/TextLayout.h"

using namespace graphics;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const auto paragraphs = parseRichText(CRichText(std::string(reinterpret_cast<const char*>(data), size)));
    if (paragraphs.size() < 20) CTextLayout(paragraphs, 30).GetLineCount();
    return 0;
}

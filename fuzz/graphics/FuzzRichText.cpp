// Arbitrary text as rich text, broken into lines, and as the style of another text.
#include "../../tests/support/FontLeaks.h"
#include "graphics/text/RichTextParser.h"
#include "graphics/text/TextLayout.h"

#include <cstdlib>

using namespace graphics;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const auto text = peru::make<CRichText>(std::string(reinterpret_cast<const char*>(data), size));
    const auto paragraphs = parseRichText(*text);
    if (paragraphs.size() < 20) CTextLayout(paragraphs, 30).GetLines();
    const auto replaced = parseRichText(*makeRichTextLike(text, "ab"));
    if (replaced.size() != 1 || replaced[0].runs.size() != 1 || replaced[0].runs[0].text != "ab")
        std::abort();
    return 0;
}

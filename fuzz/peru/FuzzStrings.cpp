// Arbitrary bytes as text in every encoding: operations must agree with each other and stay within the bytes.
#include "peru/Errors.h"
#include "peru/strings/StringFormat.h"
#include "peru/strings/StringTokenizer.h"

#include <cstdint>
#include <cstdlib>

using namespace peru;

namespace {

void require(bool condition) {
    if (!condition) std::abort();
}

// Separate blocks of the exact size, so that the address sanitizer detects a read past the end.
P<IString> makeText(const P<ICharEncoding>& encoding, const uint8_t* data, size_t size) {
    auto* block = static_cast<uint8_t*>(std::malloc(size ? size : 1));
    std::copy(data, data + size, block);
    return make<CString>(encoding, block, static_cast<int32_t>(size), EStringStorage::adopt);
}

void exercise(const P<IString>& a, const P<IString>& b) {
    require(a->equals(b) == (a->compare(b) == 0));
    if (a->equals(b)) require(a->getHash() == b->getHash());
    require((a->compare(b) < 0) == (b->compare(a) > 0));
    require(a->toUTF32String()->equals(a));
    P<IString> joined = a->concat(b);
    require(joined->getLength() == a->getLength() + b->getLength() ||
            joined->isEncoding(ICharEncoding::kUTF8));
    SStringPos found = a->find(b);
    if (found.isFound()) require(a->startsWithAt(found, b));
    if (!a->isEncoding(ICharEncoding::kCodePage)) require(a->findLast(b).isFound() == found.isFound());
    if (found.isFound() && !b->isEmpty()) {
        P<IString> removed = a->replace(b, "");
        require(removed->getLength() < a->getLength());
    }
    a->replace(a->substring(kStringBegin, a->getPosition(1)), b);
    a->replaceRange(a->getPosition(a->getLength() / 2), 1, b);
    a->trim();
    a->toUpper();
    a->toLatin1String();
    CString::toStdU16String(a);
    int32_t count = 0;
    for (SStringPos pos = kStringBegin; pos.index < a->getLength(); ++count) a->getCharAndAdvance(pos);
    require(count == a->getLength());
    for (WEnum<IString> lines(make<CStringLineTokenizerEnum>(a)); lines.hasMore();) lines.getNext();
}

void formatWith(const P<IString>& text) {
    try {
        P<CStringFormat> formatter = make<CStringFormat>(text);
        for (int i = 0; i < 4; ++i) {
            // Tries each type: the format decides which it accepts, and a rejected value changes nothing.
            try {
                formatter->push(-7);
                continue;
            } catch (const CInvalidArgError&) {
            }
            try {
                formatter->push(1.5);
                continue;
            } catch (const CInvalidArgError&) {
            }
            formatter->push(text);
        }
        formatter->getText();
    } catch (const CError&) {
    }
    try {
        parseInteger(text);
        parseDouble(text);
    } catch (const CParseError&) {
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < 2) return 0;
    const P<ICharEncoding> encodings[] = {getUTF8CharEncoding(), getUTF16CharEncoding(),
                                          getUTF32CharEncoding(), getLatin1CharEncoding(),
                                          getCPCharEncoding()};
    const P<ICharEncoding>& first = encodings[data[0] % 5];
    const P<ICharEncoding>& second = encodings[data[0] / 5 % 5];
    size_t cut = data[1] % (size - 1);
    P<IString> a = makeText(first, data + 2 + cut, size - 2 - cut);
    P<IString> b = makeText(second, data + 2, cut);
    exercise(a, b);
    exercise(a, a->substring(a->getPosition(a->getLength() / 3), a->getPosition(a->getLength() / 2)));
    formatWith(a);
    return 0;
}

// Arbitrary bytes as URIs: a parsed URI must be ASCII, parse to the same URI again and resolve back from its
// relative form.
#include "peru/Errors.h"
#include "peru/uri/URI.h"

#include <cstdint>
#include <cstdlib>

using namespace peru;

namespace {

void require(bool condition) {
    if (!condition) std::abort();
}

P<IURI> parse(std::string_view bytes) {
    try {
        return make<CURI>(CString::fromUTF8(bytes));
    } catch (const CURIFormatError&) {
        return nullptr;
    }
}

void exercise(const P<IURI>& uri) {
    const std::string text = CString::toStdString(uri->getAsString());
    for (char c : text) require(c >= 0x20 && c < 0x7F);
    const P<IURI> again = parse(text);
    require(again && again->equals(uri));
    require(again->isRelative() == uri->isRelative() && again->isHierarchical() == uri->isHierarchical());
    require(again->getPath()->equals(uri->getPath()));
    uri->getFileName();
    uri->getExtension();
    uri->getUnescapedQuery();
    int depth = 0;
    for (P<IURI> parent = uri->getParent(); parent; parent = parent->getParent()) require(++depth < 10000);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    // Two texts, separated by the first line feed.
    const std::string_view bytes(reinterpret_cast<const char*>(data), size);
    const size_t cut = bytes.find('\n');
    const P<IURI> first = parse(bytes.substr(0, cut));
    if (!first) return 0;
    exercise(first);
    if (cut == std::string_view::npos) return 0;

    const std::string_view rest = bytes.substr(cut + 1);
    require(CString::toStdString(CURI::unescape(CURI::escape(CString::fromUTF8(rest), ""))) == rest);
    if (first->isHierarchical()) exercise(first->appendPath(CString::fromUTF8(rest)));
    const P<IURI> second = parse(rest);
    if (!second || !second->isHierarchical()) return 0;
    exercise(first->resolveAgainst(second));
    if (!first->isRelative()) require(first->makeRelativeTo(second)->resolveAgainst(second)->equals(first));
    return 0;
}

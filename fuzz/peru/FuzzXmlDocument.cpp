// Arbitrary bytes as XML: an accepted document must print, parse again and print the same.
#include "peru/Errors.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/streams/StringStreams.h"
#include "peru/uri/IURI.h"
#include "peru/xml/XmlDocument.h"

#include <cstdint>
#include <cstdlib>

using namespace peru;

namespace {

void require(bool condition) {
    if (!condition) std::abort();
}

// The whole tree as one text, without the layout.
void describe(const P<IXmlNode>& node, std::string& out) {
    out += "<" + CString::toStdString(node->getName());
    WEnum<IXmlProperty> properties = node->getProperties();
    while (properties.hasMore()) {
        const P<IXmlProperty> property = properties.getNext();
        out += " " + CString::toStdString(property->getName()) + "=" +
               CString::toStdString(property->getValue());
    }
    out += ">" + CString::toStdString(node->getText());
    WEnum<IXmlNode> children = node->getChildNodes();
    while (children.hasMore()) describe(children.getNext(), out);
    out += "</>";
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::string_view bytes(reinterpret_cast<const char*>(data), size);
    const bool wide = size > 0 && data[size - 1] % 2 == 0;
    const auto document = make<CXmlDocument>("1.0", wide ? "UTF-16" : "UTF-8");
    try {
        const auto text = make<CUTF8String>(bytes.data(), static_cast<int32_t>(bytes.size()));
        document->parse(make<CStringInStream>(text));
    } catch (const CParseError&) {
        return 0;
    }
    std::string before;
    std::string after;
    describe(document, before);

    const auto printed = make<CMemoryIOStream>();
    document->print(printed);
    printed->seek(0);
    const auto again = make<CXmlDocument>("1.0", wide ? "UTF-16" : "UTF-8");
    again->parse(printed);
    describe(again, after);
    require(before == after);
    const P<IString> text = again->printToString();
    document->parseString(text);
    require(text->equals(document->printToString()));
    return 0;
}

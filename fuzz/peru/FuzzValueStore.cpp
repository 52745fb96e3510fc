// A value store over an arbitrary document: a value that was set must be readable afterwards, also in a store
// over the printed document.
#include "peru/Errors.h"
#include "peru/settings/XmlValueStore.h"
#include "peru/uri/URI.h"
#include "peru/xml/XmlDocument.h"
#include "peru/xml/XmlText.h"

#include <cstdint>
#include <cstdlib>

using namespace peru;

namespace {

void require(bool condition) {
    if (!condition) std::abort();
}

P<CXmlValueStore> makeStore(const P<CXmlDocument>& document, CXmlValueStore::EMode mode) {
    static const P<IURI> uri = make<CURI>("file:///nowhere.xml");
    return make<CXmlValueStore>(document, uri, EStoreAccess::readWrite, mode, false);
}

void walk(CXmlValueStore& store, const P<IString>& section, int depth) {
    WEnum<IString> values = store.getValueNames(section);
    while (values.hasMore()) {
        const P<IString> name = values.getNext();
        store.getString(section, name, nullptr);
        store.getBool(section, name, true);
    }
    WEnum<IString> sections = store.getSectionNames(section);
    while (depth < 20 && sections.hasMore()) walk(store, section + "/" + sections.getNext(), depth + 1);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    // The input is a mode byte, then lines with document, section and name; the rest is the value.
    if (size == 0) return 0;
    const auto mode = data[0] % 2 ? CXmlValueStore::EMode::attributes : CXmlValueStore::EMode::elements;
    std::string_view rest(reinterpret_cast<const char*>(data) + 1, size - 1);
    P<IString> parts[3];
    for (P<IString>& part : parts) {
        const size_t cut = std::min(rest.find('\n'), rest.size());
        part = CString::fromUTF8(rest.substr(0, cut));
        rest.remove_prefix(std::min(cut + 1, rest.size()));
    }
    const P<IString> value = CString::fromUTF8(rest);
    const auto document = make<CXmlDocument>();
    try {
        if (!parts[0]->isEmpty()) document->parseString(parts[0]);
    } catch (const CParseError&) {
        return 0;
    }
    const auto store = makeStore(document, mode);
    walk(*store, CString::empty(), 0);
    try {
        store->setString(parts[1], parts[2], value);
    } catch (const CInvalidArgError&) {
        return 0;
    }
    const auto copy = make<CXmlDocument>();
    copy->parseString(document->printToString());
    for (const auto& each : {store, makeStore(copy, mode)}) {
        const P<IString> found = each->getString(parts[1], parts[2], CString::empty());
        require(CString::toStdString(found) == CString::toStdString(value));
        walk(*each, CString::empty(), 0);
    }
    store->removeValue(parts[1], parts[2]);
    require(store->getString(parts[1], parts[2], CString::empty())->getDataSize() == 0);
    store->removeSection(parts[1]);
    store->removeSection("");
    return 0;
}

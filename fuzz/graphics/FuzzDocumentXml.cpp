// Arbitrary text as an exported document. What can be read is written to the same bytes twice.
#include "graphics/documents/GraphicDocument.h"
#include "graphics/storage/DocumentArchive.h"
#include "peru/Errors.h"

#include <cstdlib>

using namespace graphics;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const auto document = peru::make<CGraphicDocument>();
    const auto load = [&](const P<peru::IXmlNode>& root, IResourceInputStore& store) {
        document->Load(root, store);
    };
    const auto save = [&](const P<peru::IXmlNode>& root, IResourceOutputStore& store) {
        document->Save(root, store);
    };
    try {
        ReadXml("project", std::string(reinterpret_cast<const char*>(data), size), load);
        const std::string text = WriteXml("project", save);
        ReadXml("project", text, load);
        if (WriteXml("project", save) != text) std::abort();
    } catch (const peru::CException&) {
    }
    return 0;
}

// Arbitrary bytes as a project archive. What can be read can be written and read again.
#include "graphics/documents/GraphicDocument.h"
#include "graphics/storage/DocumentArchive.h"
#include "peru/Errors.h"

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
        ReadArchive(kProjectForm, std::string(reinterpret_cast<const char*>(data), size), load);
        ReadArchive(kProjectForm, WriteArchive(kProjectForm, save), load);
    } catch (const peru::CException&) {
    }
    return 0;
}

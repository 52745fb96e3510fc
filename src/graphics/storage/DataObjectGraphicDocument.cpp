#include "graphics/storage/DataObjectGraphicDocument.h"

#include "graphics/storage/DocumentArchive.h"
#include "graphics/storage/XmlValues.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"

namespace graphics {

namespace {

constexpr const char* kDesign = "graphic-document";

} // namespace

CDataObjectGraphicDocument::CDataObjectGraphicDocument() : wxCustomDataObject(wxString(kClipboardFormat)) {}

CDataObjectGraphicDocument::CDataObjectGraphicDocument(const P<CGraphicDocument>& document)
    : CDataObjectGraphicDocument() {
    const std::string bytes =
        WriteArchive(kClipboardForm, [&](const Node& root, IResourceOutputStore& store) {
            document->Save(addChild(root, kDesign), store);
        });
    if (!SetData(bytes.size(), bytes.data())) throw peru::CError("Out of memory");
}

P<CGraphicDocument> CDataObjectGraphicDocument::GetDocument() const {
    auto document = peru::make<CGraphicDocument>();
    ReadArchive(kClipboardForm, std::string(static_cast<const char*>(GetData()), GetSize()),
                [&](const Node& root, IResourceInputStore& store) {
                    const Node design = root->getChildNode(kDesign);
                    if (!design)
                        throw peru::CParseError(peru::localize("graphics.CDataObjectGraphicDocument.NoDesign",
                                                               "The clipboard holds no design."));
                    document->Load(design, store);
                });
    return document;
}

} // namespace graphics

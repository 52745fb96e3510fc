#include "host_support/Guard.h"
#include "peru/streams/IStreamManager.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/xml/XmlDocument.h"

#include <cstdlib>

using namespace tonewright::host_support;
using peru::CString;
using peru::IXmlNode;

namespace {

void resolveMedium(const P<IXmlNode>& track, int number, const P<peru::IURI>& base) {
    const P<IXmlNode> node = track->getChildNode("Uri");
    if (!node || node->getText()->isEmpty())
        throw peru::CError(peru::format({"tonewright.Arrangement.noUri", "Track %d has no Uri"}, number));
    const auto uri = peru::make<peru::CURI>(node->getText());
    if (uri->isRelative()) node->setText(uri->resolveAgainst(base)->getAsString());
}

} // namespace

char16_t* TONEWRIGHT_Host_ReadArrangement(const char* path) {
    char16_t* const uriText = TONEWRIGHT_Host_PathToURI(path);
    if (!uriText) return nullptr;
    char16_t* const text = guard<char16_t*>(nullptr, [&] {
        const P<peru::IURI> uri = tonewright::exports::toURI(uriText);
        const auto document = peru::make<peru::CXmlDocument>();
        document->parse(peru::getStreamManager()->getInStream(uri));
        const P<IXmlNode> root = document->getRootNode();
        const P<IXmlNode> tracks = root ? root->getChildNode("Tracks") : nullptr;
        int count = 0;
        if (tracks)
            for (auto nodes = tracks->getChildNodesByName("Track"); nodes.hasMore();)
                resolveMedium(nodes.getNext(), ++count, uri);
        if (count == 0)
            throw peru::CError(peru::localize("tonewright.Arrangement.noTracks",
                                              "This is not an arrangement: it has no tracks"));
        const std::u16string xml = CString::toStdU16String(document->printToString());
        auto* copy = static_cast<char16_t*>(std::malloc((xml.size() + 1) * sizeof(char16_t)));
        if (copy) std::memcpy(copy, xml.c_str(), (xml.size() + 1) * sizeof(char16_t));
        return copy;
    });
    std::free(uriText);
    return text;
}

#include "Arrangement.h"

#include "HostLog.h"
#include "Text.h"
#include "peru/Errors.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/uri/URI.h"
#include "peru/xml/XmlDocument.h"

#include <algorithm>
#include <fstream>
#include <iterator>
#include <stdexcept>

namespace host {

namespace fs = std::filesystem;

namespace {

using peru::IXmlNode;
using peru::P;

P<peru::IXmlDocument> parse(const fs::path& file) {
    std::ifstream in(file, std::ios::binary);
    const std::string bytes(std::istreambuf_iterator<char>(in), {});
    if (!in.good() && !in.eof()) throw std::runtime_error("It cannot be read");
    const auto stream = peru::make<peru::CMemoryIOStream>();
    stream->write(reinterpret_cast<const uint8_t*>(bytes.data()), static_cast<int64_t>(bytes.size()));
    stream->reset();
    const P<peru::IXmlDocument> document = peru::make<peru::CXmlDocument>();
    document->parse(stream);
    return document;
}

void resolve(const P<IXmlNode>& track, int number, const P<peru::IURI>& base) {
    const P<IXmlNode> node = track->getChildNode("Uri");
    if (!node || node->getText()->isEmpty())
        throw std::runtime_error("Track " + std::to_string(number) + " has no Uri");
    const auto uri = peru::make<peru::CURI>(node->getText());
    if (uri->isRelative()) node->setText(uri->resolveAgainst(base)->getAsString());
}

} // namespace

bool isArrangement(const fs::path& file) {
    std::string extension = file.extension();
    std::transform(extension.begin(), extension.end(), extension.begin(),
                   [](unsigned char c) { return std::tolower(c); });
    return extension == ".xml";
}

std::u16string readArrangement(const fs::path& file) {
    checkInput(file);
    try {
        const P<peru::IXmlDocument> document = parse(file);
        const P<peru::IURI> base = peru::make<peru::CURI>(toURI(file).c_str());
        const P<IXmlNode> root = document->getRootNode();
        const P<IXmlNode> tracks = root ? root->getChildNode("Tracks") : nullptr;
        int count = 0;
        if (tracks)
            for (auto nodes = tracks->getChildNodesByName("Track"); nodes.hasMore();)
                resolve(nodes.getNext(), ++count, base);
        if (count == 0) throw std::runtime_error("This is no arrangement: it has no tracks");
        return peru::CString::toStdU16String(document->printToString());
    } catch (const peru::CException& error) {
        throw std::runtime_error(asReason(peru::CString::toStdString(error.getDescription()), file));
    }
}

CHandle openArrangement(CLibrary& library, const fs::path& file, const SSampleFormat& samples) {
    const std::u16string text = readArrangement(file);
    CHostLog::takeReason();
    CHandle source(library.CreateAudioSourceFromEditorXml(text.c_str(), samples.rate, samples.channels,
                                                          samples.bytesPerSample));
    if (!source) {
        const std::string reason = CHostLog::takeReason();
        throw std::runtime_error(reason.empty() ? "It cannot be mixed" : asReason(reason, file));
    }
    if (!(library.AudioSource_GetDuration(source.get()) > 0))
        throw std::runtime_error("Nothing in it would be heard: no track ends behind its start");
    return source;
}

} // namespace host

#include "tonewright/EditorXml.h"

#include "peru/Errors.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "peru/uri/URI.h"
#include "peru/xml/XmlDocument.h"
#include "tonewright/TrackModifierFade.h"

#include <cmath>

namespace tonewright {

namespace {

using peru::IXmlNode;

P<peru::IString> readText(const P<IXmlNode>& parent, const char* name) {
    const P<IXmlNode> child = parent->getChildNode(name);
    return child ? child->getText() : peru::CString::empty();
}

double readDouble(const P<IXmlNode>& parent, const char* name, double missing) {
    const P<peru::IString> text = readText(parent, name);
    if (text->isEmpty()) return missing;
    const auto fail = [&](const P<peru::IString>& reason) {
        throw peru::CParseError(peru::format("%s (%s: \"%s\")", reason, name, text));
    };
    double value = missing;
    try {
        value = peru::parseDouble(text);
    } catch (const peru::CParseError& error) {
        fail(error.getDescription());
    }
    if (!std::isfinite(value)) fail(peru::localize("tonewright.EditorXml.notFinite", "Not a finite number."));
    return value;
}

// The mixer counts milliseconds in 32 bits.
double readTime(const P<IXmlNode>& parent, const char* name) {
    constexpr double kLimit = 4000000.0;
    const double time = readDouble(parent, name, 0.0);
    if (std::fabs(time) <= kLimit) return time;
    throw peru::CParseError(peru::format(
        {"tonewright.EditorXml.limit", "An arrangement is limited to %.0f seconds. (%s: \"%g\")"}, kLimit,
        name, time));
}

void readModifiers(const P<IXmlNode>& node, CTrack& track) {
    for (auto modifiers = node->getChildNodesByName("Modifier"); modifiers.hasMore();) {
        const P<IXmlNode> fade = modifiers.getNext()->getChildNode("TrackModifierFade");
        if (!fade) continue;
        const double timestamp = readDouble(fade, "Timestamp", 0.0);
        const double duration = readDouble(fade, "Duration", 0.0);
        const double startValue = readDouble(fade, "StartValue", 1.0);
        const double endValue = readDouble(fade, "EndValue", 1.0);
        track.addModifier(peru::make<CTrackModifierFade>(timestamp, startValue, endValue, duration));
    }
}

P<CTrack> readTrack(const P<IXmlNode>& node) {
    const P<CTrack> track = peru::make<CTrack>();
    track->setTrackStart(readTime(node, "TrackStart"));
    track->setSourceStartTime(readTime(node, "SourceStartTime"));
    track->setSourceEndTime(readTime(node, "SourceEndTime"));
    track->setURI(peru::make<peru::CURI>(readText(node, "Uri")));
    if (const P<IXmlNode> modifiers = node->getChildNode("Modifiers")) readModifiers(modifiers, *track);
    return track;
}

} // namespace

std::vector<P<CTrack>> readEditorXml(const peru::CStringArg& text) {
    const P<peru::IString> utf8 = peru::CString::fromView(text.getView())->toUTF8String();
    const P<peru::CMemoryIOStream> stream = peru::make<peru::CMemoryIOStream>();
    // The mark says that this is UTF-8, whatever encoding the text declares for its file.
    if (!utf8->startsWith(u"\uFEFF")) stream->write("\xEF\xBB\xBF", 3);
    stream->write(utf8->getData(), utf8->getDataSize());
    stream->reset();
    const P<peru::IXmlDocument> document = peru::make<peru::CXmlDocument>("1.0", "utf-8");
    document->parse(stream);

    std::vector<P<CTrack>> tracks;
    const P<IXmlNode> root = document->getRootNode();
    const P<IXmlNode> list = root ? root->getChildNode("Tracks") : nullptr;
    if (!list) return tracks;
    for (auto nodes = list->getChildNodesByName("Track"); nodes.hasMore();)
        tracks.push_back(readTrack(nodes.getNext()));
    return tracks;
}

} // namespace tonewright

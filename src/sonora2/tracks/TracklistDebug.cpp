#include "peru/strings/StringFormat.h"
#include "peru/xml/XmlDocument.h"
#include "sonora2/tracks/Tracklist.h"

namespace sonora2::common {

namespace {

void set(const P<peru::IXmlNode>& node, const char* name, double seconds) {
    node->setProperty(name, peru::format("%f", seconds));
}

void set(const P<peru::IXmlNode>& node, const char* name, uint32_t number) {
    node->setProperty(name, peru::format("%u", number));
}

void set(const P<peru::IXmlNode>& node, const char* name, int number) {
    node->setProperty(name, peru::format("%d", number));
}

} // namespace

P<peru::IXmlDocument> CTracklist::getDebugDocument() {
    peru::CMutexLock lock(m_lock);
    const P<peru::IXmlDocument> document = peru::make<peru::CXmlDocument>();
    const P<peru::IXmlNode> root = document->addChildNode("CTracklist");
    set(root, "currentFrame", m_currentFrame);
    set(root, "maxFrame", m_maxFrame);
    set(root, "framerateNum", m_framerateNum);
    set(root, "framerateDen", m_framerateDen);
    set(root, "sortindex", m_sortIndex);
    set(root, "currentTime", toSeconds(m_currentFrame));
    set(root, "maxTime", toSeconds(m_maxFrame));
    const P<peru::IXmlNode> tracks = root->addChildNode("tracks");
    for (const SLane& lane : m_lanes)
        for (const auto& entry : lane.entries)
            describe(tracks->addChildNode("track"), *entry, lane.sortIndex);
    return document;
}

void CTracklist::describe(const P<peru::IXmlNode>& node, const SEntry& entry, int sortIndex) const {
    set(node, "startTime", toSeconds(entry.start));
    set(node, "endTime", toSeconds(entry.end));
    set(node, "startFrame", entry.start);
    set(node, "endFrame", entry.end);
    set(node, "duration", toSeconds(entry.end) - toSeconds(entry.start));
    set(node, "sortIndex", sortIndex);
    node->setProperty("enabled", entry.track->isEnabled() ? "true" : "false");
    node->setText(entry.track->getDebugText());
}

} // namespace sonora2::common

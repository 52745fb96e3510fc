#include "ced/Project.h"

#include "graphics/storage/XmlValues.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/ISystem.h"

#include <algorithm>

namespace ced {

using graphics::Node;

namespace {

constexpr const char* kRoot = "project";
constexpr const char* kDesign = "graphic-document";
constexpr auto kNoTarget = static_cast<TargetType>(kTargetTypeCount);
constexpr const char* kContent = "content";
constexpr const char* kFormats = "formats";
constexpr const char* kVersionName = "version";
constexpr const char* kCreator = "creator";
constexpr const char* kCutMarks = "print-cutmarks";
constexpr const char* kColoured = "print-coloured";

bool isKnownAttribute(std::string_view name) {
    return name == kVersionName || name == kCreator || name == kCutMarks || name == kColoured;
}

} // namespace

bool CProject::IsFromLaterVersion() const {
    return m_version > kVersion;
}

const P<CDocument>& CProject::GetTarget(TargetType type) const {
    return m_targets.at(static_cast<size_t>(type));
}

void CProject::SetTarget(TargetType type, const P<CDocument>& document) {
    m_targets.at(static_cast<size_t>(type)) = document;
}

std::vector<std::pair<std::string, P<CDocument>>> CProject::GetDocuments() const {
    std::vector<std::pair<std::string, P<CDocument>>> documents;
    for (int i = 0; i < kTargetTypeCount; ++i) {
        const auto type = static_cast<TargetType>(i);
        if (GetTarget(type)) documents.emplace_back(TargetTypeToXml(type), GetTarget(type));
    }
    documents.insert(documents.end(), m_otherTargets.begin(), m_otherTargets.end());
    return documents;
}

const SXmlFragment* CProject::FindFormat(const std::string& id) const {
    const auto& formats = m_formats.children;
    const auto found = std::find_if(formats.begin(), formats.end(),
                                    [&](const auto& format) { return format.GetAttribute("id") == id; });
    return found == formats.end() ? nullptr : &*found;
}

void CProject::SaveContent(const Node& root, graphics::IResourceOutputStore& store) const {
    graphics::writeInteger(root, kVersionName, std::max<int64_t>(m_version, kVersion));
    graphics::writeAttribute(root, kCreator, m_creator);
    graphics::writeBool(root, kCutMarks, m_hasCutMarks);
    graphics::writeBool(root, kColoured, m_isColoured);
    m_content.SaveContent(graphics::addChild(root, kContent), store);
    m_formats.SaveContent(graphics::addChild(root, kFormats), store);
    for (const auto& [name, document] : GetDocuments())
        document->Save(root->addChildNode(peru::CString::fromUTF8(name)), store);
    m_others.SaveContent(root, store);
}

void CProject::LoadContent(const Node& root, graphics::IResourceInputStore& store) {
    graphics::readInteger(root, kVersionName, m_version);
    m_creator.clear();
    graphics::readAttribute(root, kCreator, m_creator);
    graphics::readBool(root, kCutMarks, m_hasCutMarks);
    graphics::readBool(root, kColoured, m_isColoured);
    if (IsFromLaterVersion())
        store.Report(peru::localize(
            "ced.CProject.LaterVersion",
            "The file is of version %VERSION%, which is later than %KNOWN%. What is "
            "unknown of it is preserved as far as possible.",
            {{"%VERSION%", peru::format("%d", m_version)}, {"%KNOWN%", peru::format("%d", kVersion)}}));
    if (const Node content = root->getChildNode(kContent)) m_content = SXmlFragment::Load(content, store);
    if (const Node formats = root->getChildNode(kFormats)) m_formats = SXmlFragment::Load(formats, store);
    m_others = SXmlFragment::LoadAttributes(root);
    std::erase_if(m_others.attributes,
                  [](const auto& attribute) { return isKnownAttribute(attribute.first); });
    bool hasContent = false, hasFormats = false;
    m_others.LoadChildren(root, store, [&](const Node& child) {
        const std::string name = graphics::getName(child);
        if (name == kContent) return !std::exchange(hasContent, true);
        if (name == kFormats) return !std::exchange(hasFormats, true);
        const auto type = TargetTypeFromXml(name);
        if (type && !GetTarget(*type)) {
            SetTarget(*type, CDocument::Load(child, store));
            return true;
        }
        if (name == kDesign) { // the clipboard
            const auto document = peru::make<CDocument>();
            document->AddItem(CItem::LoadDesign(child, store));
            m_otherTargets.emplace_back(TargetTypeToXml(kNoTarget), document);
            return true;
        }
        if (!CDocument::IsDocument(child)) return false;
        m_otherTargets.emplace_back(name, CDocument::Load(child, store));
        return true;
    });
}

std::string CProject::ToArchive(bool isLossless) const {
    return graphics::WriteArchive(
        graphics::kProjectForm,
        [this](const Node& root, graphics::IResourceOutputStore& store) { SaveContent(root, store); },
        isLossless, m_entries);
}

std::string CProject::ToXml(EMode mode) const {
    return graphics::WriteXml(
        kRoot, [this](const Node& root, graphics::IResourceOutputStore& store) { SaveContent(root, store); },
        mode);
}

void CProject::Save(const P<peru::IURI>& file, bool isLossless) const {
    const std::string bytes = ToArchive(isLossless);
    peru::getSystem()->replaceFile(file, bytes.data(), static_cast<int64_t>(bytes.size()));
}

void CProject::Export(const P<peru::IURI>& file, EMode mode) const {
    const std::string bytes = ToXml(mode);
    peru::getSystem()->replaceFile(file, bytes.data(), static_cast<int64_t>(bytes.size()));
}

} // namespace ced

#include "ced/XmlFragment.h"

#include "graphics/images/ImageCodec.h"
#include "graphics/storage/XmlValues.h"
#include "peru/strings/String.h"

#include <algorithm>
#include <map>

namespace ced {

using graphics::Node;

namespace {

// Whether a name is a word, a number and an ending, as stores name their entries.
bool isEntryName(std::string_view name, std::string_view word, std::string_view ending) {
    if (name.size() <= word.size() + ending.size() || !name.starts_with(word) || !name.ends_with(ending))
        return false;
    const std::string_view number = name.substr(word.size(), name.size() - word.size() - ending.size());
    return number.find_first_not_of("0123456789") == std::string_view::npos;
}

enum class EKind { none, bitmap, richText, memory };

// Tells attachments that stores can load and save from other elements. Anything else remains plain XML.
EKind getKind(const SXmlFragment& fragment) {
    if (!fragment.name.starts_with("attachment-")) return EKind::none;
    if (fragment.FindChild("base64")) {
        if (!fragment.GetAttribute("extension").empty()) return EKind::bitmap;
        return fragment.name == "attachment-richtextbuffer" ? EKind::richText : EKind::memory;
    }
    const std::string entry = fragment.GetAttribute("name");
    if (isEntryName(entry, "text", ".xml")) return EKind::richText;
    if (isEntryName(entry, "memory", "")) return EKind::memory;
    const auto format = graphics::getFormatOfFile(entry);
    if (format != graphics::EBitmapFormat::none &&
        isEntryName(entry, "image", "." + graphics::getExtension(format)))
        return EKind::bitmap;
    return EKind::none;
}

// Attributes and children that stores write themselves.
bool isOfStore(std::string_view name) {
    return name == "name" || name == "size" || name == "extension" || name == "base64";
}

} // namespace

SXmlFragment SXmlFragment::Load(const Node& node, graphics::IResourceInputStore& store) {
    SXmlFragment fragment = LoadAttributes(node);
    fragment.LoadChildren(node, store);
    return fragment;
}

SXmlFragment SXmlFragment::LoadAttributes(const Node& node) {
    SXmlFragment fragment;
    fragment.name = graphics::getName(node);
    for (auto properties = node->getProperties(); properties.hasMore();) {
        const auto property = properties.getNext();
        fragment.attributes.emplace_back(peru::CString::toStdString(property->getName()),
                                         peru::CString::toStdString(property->getValue()));
    }
    return fragment;
}

void SXmlFragment::LoadChildren(const Node& node, graphics::IResourceInputStore& store,
                                const std::function<bool(const Node&)>& isKnown) {
    text = peru::CString::toStdString(node->getText());
    for (auto nodes = node->getChildNodes(); nodes.hasMore();) {
        const Node child = nodes.getNext();
        if (!isKnown || !isKnown(child)) children.push_back(Load(child, store));
    }
    std::map<std::string, int> counts;
    for (const SXmlFragment& child : children) ++counts[child.name];
    // Stores find attachments by their key, so only the first one of a key could be loaded.
    for (SXmlFragment& child : children)
        if (counts[child.name] == 1) child.LoadAttachment(node, store);
}

void SXmlFragment::LoadAttachment(const Node& parent, graphics::IResourceInputStore& store) {
    std::string source;
    switch (getKind(*this)) {
    case EKind::bitmap:
        if (const auto bitmap = store.LoadBitmap(parent, name, source)) attachment = bitmap;
        break;
    case EKind::richText:
        if (const auto richText = store.LoadRichText(parent, name)) attachment = richText;
        break;
    case EKind::memory:
        if (const auto block = store.LoadMemory(parent, name)) attachment = block;
        break;
    case EKind::none:
        break;
    }
    if (attachment.index() == 0) return;
    std::erase_if(attributes, [](const auto& attribute) { return isOfStore(attribute.first); });
    std::erase_if(children, [](const auto& data) { return isOfStore(data.name); });
}

void SXmlFragment::SaveContent(const Node& node, graphics::IResourceOutputStore& store) const {
    for (const auto& [attribute, value] : attributes)
        node->setProperty(peru::CString::fromUTF8(attribute), peru::CString::fromUTF8(value));
    if (!text.empty()) node->setText(peru::CString::fromUTF8(text));
    for (const SXmlFragment& child : children) child.Save(node, store);
}

void SXmlFragment::Save(const Node& parent, graphics::IResourceOutputStore& store) const {
    if (attachment.index() == 0) {
        SaveContent(parent->addChildNode(peru::CString::fromUTF8(name)), store);
        return;
    }
    if (const auto* bitmap = std::get_if<P<graphics::CBitmap>>(&attachment))
        store.SaveBitmap(parent, name, *bitmap, {});
    else if (const auto* richText = std::get_if<P<graphics::CRichText>>(&attachment))
        store.SaveRichText(parent, name, *richText);
    else
        store.SaveMemory(parent, name, std::get<P<peru::IMemoryBlock>>(attachment));
    Node written;
    for (auto nodes = parent->getChildNodesByName(peru::CString::fromUTF8(name)); nodes.hasMore();)
        written = nodes.getNext();
    if (written) SaveContent(written, store);
}

std::string SXmlFragment::GetAttribute(std::string_view attribute) const {
    for (const auto& [known, value] : attributes)
        if (known == attribute) return value;
    return {};
}

const SXmlFragment* SXmlFragment::FindChild(std::string_view child) const {
    const auto found = std::find_if(children.begin(), children.end(),
                                    [&](const auto& known) { return known.name == child; });
    return found == children.end() ? nullptr : &*found;
}

} // namespace ced

#include "Attachments.h"

#include "peru/xml/IXmlProperty.h"

#include <algorithm>
#include <map>
#include <set>

namespace host::covers {

using Node = P<peru::IXmlNode>;

namespace {

struct SKeyKind {
    const char* key;
    const char* kind;
    const char* extension; // of attachments without a name, unless their node has it
};

constexpr SKeyKind kKinds[] = {
    {"attachment-richtextbuffer", "text", "xml"},
    {"attachment-bitmap", "image", "jpg"},
    {"attachment-thumb", "image", "jpg"}, // also of "attachment-thumbnail"
};

std::string getName(const Node& node) {
    return peru::CString::toStdString(node->getName());
}

std::string getAttribute(const Node& node, const char* name) {
    const P<peru::IXmlProperty> property = node->getProperty(name);
    return property ? peru::CString::toStdString(property->getValue()) : std::string();
}

class CWalk {
public:
    CWalk(graphics::IResourceInputStore& store, const std::function<void(const SAttachment&)>& use)
        : m_store(store), m_use(use) {}

    void visit(const Node& node) {
        std::vector<Node> attachments;
        for (auto children = node->getChildNodes(); children.hasMore();) {
            const Node child = children.getNext();
            if (getName(child).starts_with("attachment-"))
                attachments.push_back(child);
            else
                visit(child);
        }
        for (const Node& attachment : attachments) {
            take(node, attachment);
            node->removeChildNode(attachment); // stores find the first one of a name
        }
    }

private:
    void take(const Node& node, const Node& child) {
        const std::string key = getName(child);
        SAttachment attachment{"", "memory", {}};
        std::string extension = getAttribute(child, "extension");
        const std::string entry = getAttribute(child, "name");
        for (const SKeyKind& each : kKinds) {
            if (!key.starts_with(each.key)) continue;
            attachment.kind = each.kind;
            if (extension.empty()) extension = each.extension;
        }
        if (!entry.empty() && !m_entries.insert(entry).second) return; // shared
        // Whatever the file says, the name stays in the folder.
        attachment.name = isPlainName(entry) ? entry : makeName(attachment.kind, extension);
        attachment.bytes = m_store.LoadMemory(node, key);
        m_use(attachment);
    }

    bool isPlainName(const std::string& name) {
        return !name.empty() && name[0] != '.' && name.find_first_of("/\\") == std::string::npos &&
               std::all_of(name.begin(), name.end(),
                           [](unsigned char c) { return c >= 0x20 && c != 0x7F; }) &&
               m_names.insert(name).second;
    }

    std::string makeName(const std::string& kind, const std::string& extension) {
        const bool isPlain =
            !extension.empty() && std::all_of(extension.begin(), extension.end(),
                                              [](unsigned char c) { return c < 0x80 && std::isalnum(c); });
        for (;;) {
            const std::string name =
                kind + std::to_string(m_numbers[kind]++) + "." + (isPlain ? extension : "bin");
            if (m_names.insert(name).second) return name;
        }
    }

    graphics::IResourceInputStore& m_store;
    const std::function<void(const SAttachment&)>& m_use;
    std::set<std::string> m_entries;
    std::set<std::string> m_names;
    std::map<std::string, int> m_numbers; // by kind
};

graphics::SArchiveForm getForm(ced::EProjectFile kind) {
    switch (kind) {
    case ced::EProjectFile::designs:
        return graphics::kTemplateForm;
    case ced::EProjectFile::theme:
        return graphics::kThemeForm;
    case ced::EProjectFile::clipboard:
        return graphics::kClipboardForm;
    default:
        return graphics::kProjectForm;
    }
}

} // namespace

void forEachAttachment(const ced::CProject& project, std::string bytes,
                       const std::function<void(const SAttachment&)>& use) {
    const auto walk = [&](const Node& root, graphics::IResourceInputStore& store) {
        CWalk(store, use).visit(root);
    };
    const ced::EProjectFile kind = project.GetFileKind();
    const graphics::SArchiveForm form = getForm(kind);
    if (kind == ced::EProjectFile::exported)
        graphics::ReadXml(form.root, bytes, walk);
    else // archives of cover pages have no XML
        graphics::ReadArchive(
            form, kind == ced::EProjectFile::coverPages ? project.ToArchive() : std::move(bytes), walk);
}

} // namespace host::covers

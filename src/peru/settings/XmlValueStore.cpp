#include "peru/settings/XmlValueStore.h"

#include "peru/Errors.h"
#include "peru/collections/Array.h"
#include "peru/files/IFileSystemManager.h"
#include "peru/settings/ValueBoxes.h"
#include "peru/streams/IStreamManager.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/system/ISystem.h"
#include "peru/xml/XmlDocument.h"
#include "peru/xml/XmlText.h"

#include <algorithm>
#include <string>

namespace peru {

namespace {

constexpr const char* kRootName = "settings";
constexpr std::string_view kLeadMark = "__L__";
constexpr std::string_view kBlankMark = "__32__";

std::string replaceAll(std::string text, std::string_view search, std::string_view replacement) {
    for (size_t at = 0; (at = text.find(search, at)) != std::string::npos; at += replacement.size())
        text.replace(at, search.size(), replacement);
    return text;
}

P<IString> encodeName(const CStringArg& name) {
    std::string bytes = replaceAll(CString::toStdString(name), " ", kBlankMark);
    const bool marked = !bytes.empty() && (bytes[0] == '-' || (bytes[0] >= '0' && bytes[0] <= '9'));
    if (marked) bytes.insert(0, kLeadMark);
    return CString::fromUTF8(bytes);
}

P<IString> decodeName(const P<IString>& name) {
    std::string bytes = CString::toStdString(name);
    if (bytes.starts_with(kLeadMark)) bytes.erase(0, kLeadMark.size());
    return CString::fromUTF8(replaceAll(bytes, kBlankMark, " "));
}

// Calls `visit` with each encoded name of the path until it returns false.
template <class F> void walkPath(const CStringArg& section, F visit) {
    const std::string path = CString::toStdString(section);
    for (size_t at = 0; at < path.size();) {
        const size_t end = std::min(path.find('/', at), path.size());
        if (end > at && !visit(encodeName(CString::fromUTF8(path.substr(at, end - at))))) return;
        at = end + 1;
    }
}

bool hasChildren(const P<IXmlNode>& node) {
    return node->getChildNodes().hasMore();
}

// In element mode an element may be a value, a section, or both.
bool isValue(const P<IXmlNode>& node) {
    return !hasChildren(node) || node->getText()->getDataSize() > 0;
}

bool isSection(const P<IXmlNode>& node) {
    return hasChildren(node) || node->getText()->getDataSize() == 0;
}

void removeChildren(const P<IXmlNode>& node) {
    WEnum<IXmlNode> children = node->getChildNodes();
    while (children.hasMore()) node->removeChildNode(children.getNext());
}

} // namespace

P<CXmlValueStore> CXmlValueStore::open(const P<IURI>& uri, EStoreAccess access, EMode mode, bool autoSave) {
    auto document = make<CXmlDocument>();
    if (const P<IInStream> stream = getStreamManager()->tryGetInStream(uri)) {
        if (!stream->isAtEnd()) document->parse(stream);
        stream->close();
    }
    return make<CXmlValueStore>(document, uri, access, mode, autoSave);
}

CXmlValueStore::CXmlValueStore(const P<IXmlDocument>& document, const P<IURI>& uri, EStoreAccess access,
                               EMode mode, bool autoSave)
    : m_document(document), m_uri(uri), m_access(access), m_mode(mode), m_autoSave(autoSave) {}

CXmlValueStore::~CXmlValueStore() = default;

P<IXmlNode> CXmlValueStore::findSection(const CStringArg& section) const {
    P<IXmlNode> node = m_document->getRootNode();
    walkPath(section, [&](const P<IString>& name) {
        if (node) node = node->getChildNode(name);
        return static_cast<bool>(node);
    });
    return node;
}

P<IXmlNode> CXmlValueStore::makeSection(const CStringArg& section) {
    P<IXmlNode> node = m_document->getRootNode();
    if (!node) node = m_document->addChildNode(kRootName);
    walkPath(section, [&](const P<IString>& name) {
        const P<IXmlNode> known = node->getChildNode(name);
        node = known ? known : node->addChildNode(name);
        return true;
    });
    return node;
}

P<IString> CXmlValueStore::findValue(const CStringArg& section, const CStringArg& name) const {
    const P<IXmlNode> node = findSection(section);
    if (!node) return nullptr;
    if (m_mode == EMode::attributes) {
        const P<IXmlProperty> property = node->getProperty(encodeName(name));
        return property ? property->getValue() : nullptr;
    }
    const P<IXmlNode> value = node->getChildNode(encodeName(name));
    return value && isValue(value) ? value->getText() : nullptr;
}

void CXmlValueStore::checkWritable() const {
    if (m_access == EStoreAccess::read) throw CReadOnlyError(m_uri->getAsString());
}

void CXmlValueStore::noteChange() {
    m_dirty = true;
    if (m_autoSave) flush();
}

void CXmlValueStore::setString(const CStringArg& section, const CStringArg& name, const CStringArg& value) {
    checkWritable();
    // Everything is validated before any section is created.
    const P<IString> encoded = CString::fromUTF8(xml::fromName(encodeName(name), "IValueStore::setString"));
    xml::fromText(value, "IValueStore::setString");
    walkPath(section, [](const P<IString>& each) {
        xml::fromName(each, "IValueStore::setString");
        return true;
    });
    const P<IXmlNode> node = makeSection(section);
    if (m_mode == EMode::attributes) {
        node->setProperty(encoded, value);
    } else {
        P<IXmlNode> element = node->getChildNode(encoded);
        if (!element) element = node->addChildNode(encoded);
        element->setText(value);
    }
    noteChange();
}

void CXmlValueStore::setInt(const CStringArg& section, const CStringArg& name, int32_t value) {
    setString(section, name, CInt::formatValue(value));
}

void CXmlValueStore::setInt64(const CStringArg& section, const CStringArg& name, int64_t value) {
    setString(section, name, CInt64::formatValue(value));
}

void CXmlValueStore::setBool(const CStringArg& section, const CStringArg& name, bool value) {
    setString(section, name, CBool::formatValue(value));
}

void CXmlValueStore::setDouble(const CStringArg& section, const CStringArg& name, double value) {
    setString(section, name, CDouble::formatValue(value));
}

P<IString> CXmlValueStore::getString(const CStringArg& section, const CStringArg& name,
                                     const P<IString>& defaultValue) {
    P<IString> text = findValue(section, name);
    return text && text->getDataSize() > 0 ? text : defaultValue;
}

template <class T>
T CXmlValueStore::getNumber(const CStringArg& section, const CStringArg& name, T defaultValue) const {
    const P<IString> text = findValue(section, name);
    return text && text->getDataSize() > 0 ? TValueBox<T>::parseValue(text) : defaultValue;
}

int32_t CXmlValueStore::getInt(const CStringArg& section, const CStringArg& name, int32_t defaultValue) {
    return getNumber(section, name, defaultValue);
}

int64_t CXmlValueStore::getInt64(const CStringArg& section, const CStringArg& name, int64_t defaultValue) {
    return getNumber(section, name, defaultValue);
}

bool CXmlValueStore::getBool(const CStringArg& section, const CStringArg& name, bool defaultValue) {
    const P<IString> text = findValue(section, name);
    if (!text) return defaultValue;
    return text->equals("true") || (defaultValue && !text->equals("false"));
}

double CXmlValueStore::getDouble(const CStringArg& section, const CStringArg& name, double defaultValue) {
    return getNumber(section, name, defaultValue);
}

bool CXmlValueStore::hasValue(const CStringArg& section, const CStringArg& name) {
    return static_cast<bool>(findValue(section, name));
}

bool CXmlValueStore::hasSection(const CStringArg& section) {
    const P<IXmlNode> node = findSection(section);
    if (!node) return false;
    const bool top = node == m_document->getRootNode();
    return top || m_mode == EMode::attributes || isSection(node);
}

WEnum<IString> CXmlValueStore::getValueNames(const CStringArg& section) {
    auto names = make<CArray>();
    const P<IXmlNode> node = findSection(section);
    if (node && m_mode == EMode::attributes) {
        WEnum<IXmlProperty> properties = node->getProperties();
        while (properties.hasMore()) names->add(decodeName(properties.getNext()->getName()));
    } else if (node) {
        WEnum<IXmlNode> children = node->getChildNodes();
        while (children.hasMore())
            if (const P<IXmlNode> child = children.getNext(); isValue(child))
                names->add(decodeName(child->getName()));
    }
    return names->createEnum();
}

WEnum<IString> CXmlValueStore::getSectionNames(const CStringArg& section) {
    auto names = make<CArray>();
    if (const P<IXmlNode> node = findSection(section)) {
        WEnum<IXmlNode> children = node->getChildNodes();
        while (children.hasMore())
            if (const P<IXmlNode> child = children.getNext(); m_mode == EMode::attributes || isSection(child))
                names->add(decodeName(child->getName()));
    }
    return names->createEnum();
}

void CXmlValueStore::removeValue(const CStringArg& section, const CStringArg& name) {
    checkWritable();
    if (!findValue(section, name)) return;
    const P<IXmlNode> node = findSection(section);
    if (m_mode == EMode::attributes) {
        node->removeProperty(encodeName(name));
    } else {
        const P<IXmlNode> value = node->getChildNode(encodeName(name));
        if (hasChildren(value))
            value->setText("");
        else
            node->removeChildNode(value);
    }
    noteChange();
}

void CXmlValueStore::removeSection(const CStringArg& section) {
    checkWritable();
    if (!hasSection(section)) return;
    P<IXmlNode> parent;
    P<IXmlNode> node = m_document->getRootNode();
    walkPath(section, [&](const P<IString>& name) {
        parent = node;
        node = node->getChildNode(name);
        return true;
    });
    // A value of the same name is kept.
    if (parent && m_mode == EMode::elements && node->getText()->getDataSize() > 0)
        removeChildren(node);
    else if (parent)
        parent->removeChildNode(node);
    else
        m_document->removeChildNode(node);
    noteChange();
}

void CXmlValueStore::flush() {
    if (!m_dirty) return;
    if (!m_document->getRootNode()) m_document->addChildNode(kRootName);
    const auto bytes = make<CMemoryIOStream>();
    m_document->print(bytes);
    if (const P<IURI> folder = m_uri->getParent()) getFileSystemManager()->createFolder(folder);
    getSystem()->replaceFile(m_uri, bytes->getBlock()->getData(), bytes->getSize());
    m_dirty = false;
}

CXmlValueStoreFactory::CXmlValueStoreFactory(CXmlValueStore::EMode mode, bool autoSave)
    : m_mode(mode), m_autoSave(autoSave) {}

CXmlValueStoreFactory::~CXmlValueStoreFactory() = default;

P<IValueStore> CXmlValueStoreFactory::openStore(const P<IURI>& uri, EStoreAccess access) {
    if (!uri->getScheme()->equalsIgnoreCase("file") || !uri->getExtension()->equalsIgnoreCase("xml"))
        return nullptr;
    return CXmlValueStore::open(uri, access, m_mode, m_autoSave);
}

} // namespace peru

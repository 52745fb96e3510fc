#include "peru/xml/XmlDocument.h"

#include "peru/Errors.h"
#include "peru/collections/Enums.h"
#include "peru/streams/StreamTools.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"
#include "peru/uri/IURI.h"
#include "peru/xml/XmlNode.h"
#include "peru/xml/XmlPrinter.h"
#include "peru/xml/XmlScan.h"
#include "peru/xml/XmlText.h"

#include <tinyxml.h>

#include <algorithm>
#include <climits>

namespace peru {

namespace {

struct SFaultText {
    const char* fileKey;
    const char* fileText;
    const char* key;
    const char* text;
};

const SFaultText& getFaultText(xml::EFault kind) {
    static constexpr SFaultText kSyntax{
        "peru.CXmlDocument.XMLParseError.file_and_line", "XML Parse Error in file '%FILE%', line %LINE%.",
        "peru.CXmlDocument.XMLParseError.line", "XML Parse Error, line %LINE%."};
    static constexpr SFaultText kEncoding{
        "peru.CXmlDocument.encodingError.file_and_line",
        "The text of the XML file '%FILE%' is not in a known encoding, such as valid UTF-8, line %LINE%.",
        "peru.CXmlDocument.encodingError.line",
        "The text of the XML document is not in a known encoding, such as valid UTF-8, line %LINE%."};
    static constexpr SFaultText kLimit{
        "peru.CXmlDocument.limitError.file_and_line",
        "The XML file '%FILE%' is too large, too deep or has too many attributes in one element, line "
        "%LINE%.",
        "peru.CXmlDocument.limitError.line",
        "The XML document is too large, too deep or has too many attributes in one element, line %LINE%."};
    return kind == xml::EFault::encoding ? kEncoding : kind == xml::EFault::limit ? kLimit : kSyntax;
}

[[noreturn]] void fail(xml::EFault kind, const P<IURI>& uri, int32_t line) {
    const SFaultText& text = getFaultText(kind);
    const P<IString> lineText = format("%d", line);
    throw CParseError(
        uri ? localize(text.fileKey, text.fileText, {{"%FILE%", uri->getAsString()}, {"%LINE%", lineText}})
            : localize(text.key, text.text, {{"%LINE%", lineText}}));
}

bool startsWith(std::string_view text, std::string_view start) {
    return text.substr(0, start.size()) == start;
}

bool declaresLatin1(std::string_view text) {
    if (!startsWith(text, "<?xml")) return false;
    std::string declaration(text.substr(0, std::min<size_t>(text.find("?>"), 200)));
    for (char& ch : declaration) ch = ch >= 'A' && ch <= 'Z' ? static_cast<char>(ch + 32) : ch;
    // Up to the quotation mark: the names of ISO-8859-10 to 16 start like this one.
    return declaration.find("iso-8859-1\"") != std::string::npos ||
           declaration.find("iso-8859-1'") != std::string::npos;
}

// Converts the bytes to UTF-8 without a mark.
std::string decode(std::string bytes, const P<IURI>& uri) {
    const bool little = startsWith(bytes, "\xFF\xFE");
    if (little || startsWith(bytes, "\xFE\xFF")) {
        std::string text;
        if (!xml::decodeUTF16(std::string_view(bytes).substr(2), !little, text))
            fail(xml::EFault::encoding, uri, xml::getLine(text, text.size()));
        return text;
    }
    if (startsWith(bytes, xml::kMark)) return bytes.erase(0, xml::kMark.size());
    return declaresLatin1(bytes) ? xml::decodeLatin1(bytes) : bytes;
}

} // namespace

CXmlDocument::CXmlDocument(const CStringArg& version, const CStringArg& encoding)
    : m_version(CString::fromUTF8(xml::fromText(version, "CXmlDocument::CXmlDocument"))),
      m_encoding(CString::fromUTF8(xml::fromText(encoding, "CXmlDocument::CXmlDocument"))),
      m_tree(std::make_unique<TiXmlDocument>()) {
    if (!m_version->equals("1.0") && !m_version->equals("1.1"))
        throw CInvalidArgError(newString("version '") + m_version + "'", "CXmlDocument::CXmlDocument");
    if (!m_encoding->equalsIgnoreCase("UTF-8") && !m_encoding->equalsIgnoreCase("UTF-16"))
        throw CInvalidArgError(newString("encoding '") + m_encoding + "'", "CXmlDocument::CXmlDocument");
}

// Node objects keep their document alive, so none exists any more.
CXmlDocument::~CXmlDocument() = default;

void CXmlDocument::parse(const P<IInStream>& stream) {
    const P<IURI> uri = stream->getURI();
    parseBytes(decode(readAll(*stream), uri), uri);
}

void CXmlDocument::parseString(const P<IString>& text) {
    if (!text) return parseBytes("", nullptr);
    const bool utf8 = text->isEncoding(ICharEncoding::kUTF8);
    const P<IString> own = utf8 ? text->getTerminated() : nullptr;
    const std::string converted = utf8 ? std::string() : CString::toStdString(text);
    std::string_view bytes = converted;
    if (utf8)
        bytes = {reinterpret_cast<const char*>(own->getData()), static_cast<size_t>(own->getDataSize())};
    if (startsWith(bytes, xml::kMark)) bytes.remove_prefix(xml::kMark.size());
    parseBytes(bytes, nullptr);
}

void CXmlDocument::parseBytes(std::string_view text, const P<IURI>& uri) {
    // Line numbers have 32 bits.
    if (text.size() > INT_MAX) fail(xml::EFault::limit, uri, 1);
    const xml::SFault fault = xml::check(text);
    if (fault.kind != xml::EFault::none) fail(fault.kind, uri, xml::getLine(text, fault.offset));
    auto tree = std::make_unique<TiXmlDocument>();
    tree->Parse(text.data(), nullptr, TIXML_ENCODING_UTF8);
    if (tree->Error()) fail(xml::EFault::syntax, uri, std::max(tree->ErrorRow(), 1));
    dropNodes(*m_tree);
    m_tree = std::move(tree);
}

std::string CXmlDocument::printBytes() const {
    CXmlPrinter printer(CString::toStdString(m_version), CString::toStdString(m_encoding));
    m_tree->Accept(&printer);
    return printer.Str();
}

bool CXmlDocument::isWide() const {
    return m_encoding->equalsIgnoreCase("UTF-16");
}

void CXmlDocument::print(const P<IOutStream>& stream) const {
    std::string bytes = printBytes();
    if (isWide()) bytes = "\xFF\xFE" + xml::encodeUTF16(bytes);
    stream->write(bytes.data(), static_cast<int64_t>(bytes.size()));
}

P<IString> CXmlDocument::printToString() const {
    const P<IString> text = CString::fromUTF8(printBytes());
    return isWide() ? text->toUTF16String() : text;
}

P<IXmlNode> CXmlDocument::getRootNode() const {
    return CXmlNode::get(share(), m_tree->RootElement());
}

P<IString> CXmlDocument::getName() const {
    return CString::empty();
}

P<IString> CXmlDocument::getText() const {
    return CString::empty();
}

void CXmlDocument::setText(const CStringArg&) {
    throw CMethodNotImplementedError("IXmlNode::setText", share());
}

P<IXmlNode> CXmlDocument::getChildNode(const CStringArg& name) const {
    return CXmlNode::get(share(), m_tree->FirstChildElement(CString::toStdString(name)));
}

WEnum<IXmlNode> CXmlDocument::getChildNodes() const {
    return P<IEnum>(make<CXmlNodeEnum>(CXmlNode::get(share(), m_tree->RootElement()), std::nullopt));
}

WEnum<IXmlNode> CXmlDocument::getChildNodesByName(const CStringArg& name) const {
    const std::string wanted = CString::toStdString(name);
    return P<IEnum>(make<CXmlNodeEnum>(CXmlNode::get(share(), m_tree->FirstChildElement(wanted)), wanted));
}

P<IXmlNode> CXmlDocument::addChildNode(const CStringArg& name) {
    if (m_tree->RootElement())
        throw CInvalidArgError("the document already has a root", "CXmlDocument::addChildNode");
    auto root = std::make_unique<TiXmlElement>(xml::fromName(name, "CXmlDocument::addChildNode"));
    return CXmlNode::get(share(), m_tree->LinkEndChild(root.release())->ToElement());
}

void CXmlDocument::removeChildNode(const P<IXmlNode>& child) {
    const P<CXmlNode> node = tryCast<CXmlNode>(child);
    if (!node || node->getElement().Parent() != m_tree.get())
        throw CInvalidArgError("child", "CXmlDocument::removeChildNode");
    TiXmlElement& root = node->getElement();
    dropNodes(root);
    m_tree->RemoveChild(&root);
}

P<IXmlProperty> CXmlDocument::getProperty(const CStringArg&) const {
    return nullptr;
}

WEnum<IXmlProperty> CXmlDocument::getProperties() const {
    return P<IEnum>(make<CEmptyEnum>());
}

void CXmlDocument::setProperty(const CStringArg&, const CStringArg&) {
    throw CMethodNotImplementedError("IXmlNode::setProperty", share());
}

void CXmlDocument::removeProperty(const CStringArg&) {}

P<IXmlDocument> CXmlDocument::getDocument() const {
    return share();
}

P<CXmlDocument> CXmlDocument::share() const {
    return P<CXmlDocument>::share(const_cast<CXmlDocument*>(this));
}

void CXmlDocument::dropNodes(TiXmlNode& parent) {
    if (m_nodeCount == 0) return;
    // Only elements carry node objects.
    if (parent.ToElement() && parent.GetUserData()) static_cast<CXmlNode*>(parent.GetUserData())->drop();
    for (TiXmlElement* i = parent.FirstChildElement(); i; i = i->NextSiblingElement()) dropNodes(*i);
}

} // namespace peru

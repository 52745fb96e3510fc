#include "peru/net/HTTPHeaders.h"

#include "peru/Errors.h"

#include <algorithm>

namespace peru::net {

namespace {

char toLower(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c + ('a' - 'A')) : c;
}

CHTTPHeaders::SHeader check(const CStringArg& name, const CStringArg& value) {
    CHTTPHeaders::SHeader header{CString::toStdString(name), CString::toStdString(value)};
    const auto isControl = [](char c) {
        return (static_cast<unsigned char>(c) < ' ' && c != '\t') || c == 0x7F;
    };
    if (!isHTTPToken(header.name)) throw CInvalidArgError("name", "CHTTPHeaders");
    if (std::any_of(header.value.begin(), header.value.end(), isControl))
        throw CInvalidArgError("value", "CHTTPHeaders");
    return header;
}

} // namespace

bool equalsIgnoreCase(std::string_view a, std::string_view b) {
    return std::equal(a.begin(), a.end(), b.begin(), b.end(),
                      [](char x, char y) { return toLower(x) == toLower(y); });
}

std::string_view trimBlanks(std::string_view text) {
    const size_t first = text.find_first_not_of(" \t");
    if (first == std::string_view::npos) return {};
    return text.substr(first, text.find_last_not_of(" \t") - first + 1);
}

bool isHTTPToken(std::string_view text) {
    constexpr std::string_view kMarks = "!#$%&'*+-.^_`|~";
    return !text.empty() && std::all_of(text.begin(), text.end(), [&](char c) {
        return (c >= '0' && c <= '9') || (toLower(c) >= 'a' && toLower(c) <= 'z') ||
               kMarks.find(c) != std::string_view::npos;
    });
}

void CHTTPHeaders::add(const CStringArg& name, const CStringArg& value) {
    m_headers.push_back(check(name, value));
}

void CHTTPHeaders::set(const CStringArg& name, const CStringArg& value) {
    SHeader header = check(name, value);
    const auto isSame = [&](const SHeader& other) { return equalsIgnoreCase(other.name, header.name); };
    const auto found = std::find_if(m_headers.begin(), m_headers.end(), isSame);
    if (found == m_headers.end()) {
        m_headers.push_back(std::move(header));
        return;
    }
    m_headers.erase(std::remove_if(found + 1, m_headers.end(), isSame), m_headers.end());
    *found = std::move(header);
}

void CHTTPHeaders::remove(std::string_view name) {
    std::erase_if(m_headers, [&](const SHeader& header) { return equalsIgnoreCase(header.name, name); });
}

void CHTTPHeaders::addReceived(std::string_view name, std::string_view value) {
    m_headers.push_back({std::string(name), std::string(value)});
}

void CHTTPHeaders::extendLast(std::string_view value) {
    if (!m_headers.empty()) m_headers.back().value.append(" ").append(value);
}

std::optional<std::string_view> CHTTPHeaders::find(std::string_view name) const {
    for (const SHeader& header : m_headers)
        if (equalsIgnoreCase(header.name, name)) return header.value;
    return std::nullopt;
}

P<IString> CHTTPHeaders::getValue(const CStringArg& name) const {
    const std::optional<std::string_view> value = find(CString::toStdString(name));
    return value ? CString::fromUTF8(*value) : nullptr;
}

} // namespace peru::net

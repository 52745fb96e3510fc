#include "peru/net/IPAddress.h"

#include "peru/Errors.h"
#include "peru/net/posix/AddressText.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"

#include <algorithm>

namespace peru::net {

CIPAddress::CIPAddress(const CStringArg& text) {
    if (!parse(CString::toStdString(text)))
        throw CParseError(localize("peru.net.CIPAddress.ParseError", "Error parsing IP address."));
}

CIPAddress::CIPAddress(std::span<const uint8_t> bytes, uint32_t scope)
    : m_size(bytes.size()), m_scope(scope) {
    if (m_size != 4 && m_size != 16) throw CInvalidArgError("bytes", "CIPAddress");
    std::copy(bytes.begin(), bytes.end(), m_bytes.begin());
}

CIPAddress::~CIPAddress() = default;

P<CIPAddress> CIPAddress::tryParse(const CStringArg& text) {
    P<CIPAddress> address(new CIPAddress);
    return address->parse(CString::toStdString(text)) ? address : nullptr;
}

bool CIPAddress::parse(std::string text) {
    if (text.starts_with('[') && text.ends_with(']')) {
        text = text.substr(1, text.size() - 2);
        if (text.find(':') == std::string::npos) return false;
    }
    m_size = posix::parseAddress(text, m_bytes, m_scope);
    return m_size != 0;
}

bool CIPAddress::isLoopback() const {
    if (!isIPv6()) return m_bytes[0] == 127;
    static constexpr std::array<uint8_t, 12> kMapped{0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0xFF, 0xFF};
    if (std::equal(kMapped.begin(), kMapped.end(), m_bytes.begin())) return m_bytes[12] == 127;
    return m_bytes[15] == 1 &&
           std::all_of(m_bytes.begin(), m_bytes.end() - 1, [](uint8_t b) { return b == 0; });
}

P<IString> CIPAddress::getAsString() const {
    return CString::fromUTF8(posix::printAddress(getBytes(), m_scope));
}

bool CIPAddress::equals(const P<IIPAddress>& other) const {
    return other && std::ranges::equal(getBytes(), other->getBytes()) && m_scope == other->getScope();
}

CTCPAddress::CTCPAddress(const P<IIPAddress>& address, uint16_t port) : m_address(address), m_port(port) {
    if (!address) throw CInvalidArgError("address", "CTCPAddress");
}

CTCPAddress::~CTCPAddress() = default;

P<IString> CTCPAddress::getAsString() const {
    return format(m_address->isIPv6() ? "[%s]:%u" : "%s:%u", m_address->getAsString(), m_port);
}

} // namespace peru::net

#include "peru/net/ProxyRules.h"

#include "peru/Errors.h"
#include "peru/net/HTTPHeaders.h"
#include "peru/net/IPAddress.h"
#include "peru/net/posix/AddressText.h"
#include "peru/uri/URI.h"

#include <charconv>

namespace peru::net {

namespace {

bool parseDecimal(std::string_view text, uint32_t& number) {
    const char* end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, number);
    return !text.empty() && error == std::errc() && stop == end;
}

bool isInNetwork(const CIPAddress& address, const CIPAddress& network, uint32_t bits) {
    const auto a = address.getBytes();
    const auto n = network.getBytes();
    if (a.size() != n.size() || bits > a.size() * 8) return false;
    for (size_t i = 0; i < a.size() && bits > 0; ++i) {
        const uint32_t count = std::min<uint32_t>(bits, 8);
        if (((a[i] ^ n[i]) >> (8 - count)) != 0) return false;
        bits -= count;
    }
    return true;
}

bool coversAddress(std::string_view entry, const CIPAddress& address) {
    const size_t slash = entry.find('/');
    const P<CIPAddress> network = CIPAddress::tryParse(CString::fromUTF8(entry.substr(0, slash)));
    if (!network) return false;
    uint32_t bits = static_cast<uint32_t>(network->getBytes().size()) * 8;
    if (slash != std::string_view::npos && !parseDecimal(entry.substr(slash + 1), bits)) return false;
    return isInNetwork(address, *network, bits);
}

bool coversName(std::string_view entry, std::string_view host) {
    if (entry.starts_with('*')) entry.remove_prefix(1);
    if (entry.starts_with('.')) entry.remove_prefix(1);
    if (entry.ends_with('.')) entry.remove_suffix(1);
    if (entry.empty() || host.size() < entry.size()) return false;
    const size_t start = host.size() - entry.size();
    return equalsIgnoreCase(host.substr(start), entry) && (start == 0 || host[start - 1] == '.');
}

// Removes the port from "host:port" and "[address]:port"; returns whether the entry has that port or none.
bool takePort(std::string_view& entry, uint32_t port) {
    const size_t colon = entry.rfind(':');
    if (colon == std::string_view::npos) return true;
    const bool bare = entry.find(':') != colon && !entry.starts_with('['); // an IPv6 address alone
    uint32_t number = 0;
    if (bare || !parseDecimal(entry.substr(colon + 1), number)) return true;
    entry = entry.substr(0, colon);
    return number == port;
}

bool covers(std::string_view entry, std::string_view host, const P<CIPAddress>& address, uint32_t port) {
    if (entry == "*") return true;
    if (equalsIgnoreCase(entry, "<local>")) return !address && host.find('.') == std::string_view::npos;
    if (!takePort(entry, port)) return false;
    return address ? coversAddress(entry, *address) : coversName(entry, host);
}

} // namespace

P<IURI> parseProxy(std::string_view text, int32_t defaultPort) {
    text = trimBlanks(text);
    if (text.empty()) return nullptr;
    const std::string full =
        text.find("://") == std::string_view::npos ? "http://" + std::string(text) : std::string(text);
    try {
        const P<IURI> uri = make<CURI>(CString::fromUTF8(full));
        if (!uri->getScheme()->equalsIgnoreCase("http") || posix::getNetworkHost(uri).empty()) return nullptr;
        const int32_t port = uri->hasPort() ? uri->getPort() : defaultPort;
        if (port < 1 || port > 0xFFFF) return nullptr;
        std::string authority = CString::toStdString(uri->getHost()) + ":" + std::to_string(port);
        if (uri->hasUserInfo()) authority = CString::toStdString(uri->getUserInfo()) + "@" + authority;
        return make<CURI>(CString::fromUTF8("http://" + authority));
    } catch (const CURIError&) {
        return nullptr;
    }
}

bool isBypassed(std::string_view list, const P<IURI>& target) {
    std::string host = posix::getNetworkHost(target);
    if (host.ends_with('.')) host.pop_back();
    const P<CIPAddress> address = CIPAddress::tryParse(CString::fromUTF8(host));
    const uint32_t port = target->hasPort() ? static_cast<uint32_t>(target->getPort()) : 80;
    while (!list.empty()) {
        const size_t end = std::min(list.find_first_of(",; \t"), list.size());
        if (end > 0 && covers(list.substr(0, end), host, address, port)) return true;
        list.remove_prefix(std::min(end + 1, list.size()));
    }
    return false;
}

} // namespace peru::net

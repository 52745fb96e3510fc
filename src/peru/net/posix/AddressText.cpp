#include "peru/net/posix/AddressText.h"

#include "peru/system/IDesktop.h"
#include "peru/uri/URIEscapes.h"

#include <algorithm>
#include <arpa/inet.h>
#include <charconv>
#include <net/if.h>

namespace peru::net::posix {

size_t parseAddress(std::string text, std::array<uint8_t, 16>& bytes, uint32_t& scope) {
    // inet_pton stops at a zero byte.
    if (text.find('\0') != std::string::npos) return 0;
    scope = 0;
    if (inet_pton(AF_INET, text.c_str(), bytes.data()) == 1) return 4;
    if (const size_t percent = text.find('%'); percent != std::string::npos) {
        const std::string name = text.substr(percent + 1);
        text.resize(percent);
        scope = if_nametoindex(name.c_str());
        if (scope == 0) {
            const char* end = name.data() + name.size();
            if (const auto [stop, error] = std::from_chars(name.data(), end, scope);
                error != std::errc() || stop != end || scope == 0)
                return 0;
        }
    }
    return inet_pton(AF_INET6, text.c_str(), bytes.data()) == 1 ? 16 : 0;
}

std::string printAddress(std::span<const uint8_t> bytes, uint32_t scope) {
    char text[INET6_ADDRSTRLEN] = {};
    inet_ntop(bytes.size() == 4 ? AF_INET : AF_INET6, bytes.data(), text, sizeof text);
    std::string printed = text;
    char name[IF_NAMESIZE];
    if (scope != 0)
        printed += std::string("%") + (if_indextoname(scope, name) ? name : std::to_string(scope));
    return printed;
}

std::string getNetworkHost(const P<IURI>& uri) {
    if (!uri || !uri->hasHost()) return {};
    std::string host = uri::unescapeBytes(CString::toStdString(uri->getHost()));
    for (const char c : host)
        if (static_cast<unsigned char>(c) <= ' ' || c == 0x7F) return {};
    if (host.starts_with('[')) return host.substr(1, host.size() - 2);
    const auto isAscii = [](char c) { return static_cast<unsigned char>(c) < 0x80; };
    return std::all_of(host.begin(), host.end(), isAscii) ? host : getDesktop()->toASCIIHost(host);
}

} // namespace peru::net::posix

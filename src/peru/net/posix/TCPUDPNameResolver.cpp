#include "peru/net/posix/TCPUDPNameResolver.h"

#include "peru/net/IPAddress.h"
#include "peru/net/posix/AddressText.h"

#include <cstring>
#include <memory>
#include <netdb.h>
#include <netinet/in.h>

namespace peru::net::posix {

namespace {

// Only fields of `found` are used, so this runs without any singleton: the thread may outlive them.
std::vector<P<INetAddress>> toAddresses(const addrinfo* found, uint16_t port) {
    std::vector<P<INetAddress>> addresses;
    for (; found; found = found->ai_next) {
        P<CIPAddress> address;
        if (found->ai_family == AF_INET) {
            sockaddr_in data;
            std::memcpy(&data, found->ai_addr, sizeof data);
            const auto* bytes = reinterpret_cast<const uint8_t*>(&data.sin_addr);
            address = make<CIPAddress>(std::span(bytes, 4));
        } else if (found->ai_family == AF_INET6) {
            sockaddr_in6 data;
            std::memcpy(&data, found->ai_addr, sizeof data);
            address =
                make<CIPAddress>(std::span<const uint8_t>(data.sin6_addr.s6_addr, 16), data.sin6_scope_id);
        }
        if (address) addresses.push_back(make<CTCPAddress>(address, port));
    }
    return addresses;
}

// Alternates between the families, starting with the one that the system prefers, so that a family without a
// working route delays a connection once only.
std::vector<P<INetAddress>> alternate(const std::vector<P<INetAddress>>& addresses) {
    std::vector<P<INetAddress>> preferred, other, mixed;
    const auto isIPv6 = [](const P<INetAddress>& a) {
        return tryCast<ITCPAddress>(a)->getIPAddress()->isIPv6();
    };
    for (const P<INetAddress>& address : addresses)
        (isIPv6(address) == isIPv6(addresses.front()) ? preferred : other).push_back(address);
    for (size_t i = 0; i < std::max(preferred.size(), other.size()); ++i) {
        if (i < preferred.size()) mixed.push_back(preferred[i]);
        if (i < other.size()) mixed.push_back(other[i]);
    }
    return mixed;
}

std::vector<P<INetAddress>> lookUp(const std::string& host, uint16_t port) {
    addrinfo hints = {};
    hints.ai_socktype = SOCK_STREAM;
    addrinfo* found = nullptr;
    if (::getaddrinfo(host.c_str(), nullptr, &hints, &found) != 0) return {};
    const std::unique_ptr<addrinfo, void (*)(addrinfo*)> owner(found, ::freeaddrinfo);
    return alternate(toAddresses(found, port));
}

} // namespace

CTCPUDPNameResolver::CTCPUDPNameResolver() = default;
CTCPUDPNameResolver::~CTCPUDPNameResolver() = default;

P<INetNameResolution> CTCPUDPNameResolver::tryStart(const P<IURI>& uri) {
    const P<IString> scheme = uri->getScheme();
    const bool http = scheme->equalsIgnoreCase("http");
    if (!http && !scheme->equalsIgnoreCase("tcp") && !scheme->equalsIgnoreCase("udp")) return nullptr;
    const int32_t port = uri->hasPort() ? uri->getPort() : http ? 80 : -1;
    const std::string host = getNetworkHost(uri);
    if (host.empty() || port < 0 || port > 0xFFFF) return make<CResolution>(CResolution::CTask::finished({}));

    const auto number = static_cast<uint16_t>(port);
    if (const P<CIPAddress> address = CIPAddress::tryParse(CString::fromUTF8(host)))
        return make<CResolution>(CResolution::CTask::finished({make<CTCPAddress>(address, number)}));
    return make<CResolution>(CResolution::CTask::start([host, number] { return lookUp(host, number); }));
}

CTCPUDPNameResolver::CResolution::CResolution(const P<CTask>& task) : m_task(task) {}
CTCPUDPNameResolver::CResolution::~CResolution() = default;

bool CTCPUDPNameResolver::CResolution::isDone(const SNetWait& wait) {
    return m_task->isDone(wait);
}

std::vector<P<INetAddress>> CTCPUDPNameResolver::CResolution::getAddresses() const {
    return m_task->isDone({}) ? m_task->getResult() : std::vector<P<INetAddress>>();
}

} // namespace peru::net::posix

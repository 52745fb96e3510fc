// IPv4 and IPv6 addresses, alone and with a port.
#pragma once

#include "peru/Object.h"
#include "peru/net/INetAddress.h"

#include <array>

namespace peru::net {

class PERU_API CIPAddress : public CObject, public IIPAddress {
public:
    // Dotted decimal, or IPv6 text with or without brackets and with an optional scope ("fe80::1%eth0").
    // Throws CParseError.
    explicit CIPAddress(const CStringArg& text);
    // 4 or 16 bytes; throws CInvalidArgError for any other number.
    explicit CIPAddress(std::span<const uint8_t> bytes, uint32_t scope = 0);
    ~CIPAddress() override;

    // Empty instead of throwing.
    static P<CIPAddress> tryParse(const CStringArg& text);

    bool isIPv6() const override { return m_size == 16; }
    std::span<const uint8_t> getBytes() const override { return {m_bytes.data(), m_size}; }
    uint32_t getScope() const override { return m_scope; }
    bool isLoopback() const override;
    P<IString> getAsString() const override;
    bool equals(const P<IIPAddress>& other) const override;
    P<IString> getObjectDesc() const override { return getAsString(); }

private:
    CIPAddress() = default;
    bool parse(std::string text);

    std::array<uint8_t, 16> m_bytes{};
    size_t m_size = 0;
    uint32_t m_scope = 0;
};

class PERU_API CTCPAddress : public CObject, public ITCPAddress {
public:
    CTCPAddress(const P<IIPAddress>& address, uint16_t port);
    ~CTCPAddress() override;

    P<IIPAddress> getIPAddress() const override { return m_address; }
    uint16_t getPort() const override { return m_port; }
    P<IString> getAsString() const override; // "127.0.0.1:80", "[::1]:80"
    P<IString> getObjectDesc() const override { return getAsString(); }

private:
    P<IIPAddress> m_address;
    uint16_t m_port;
};

} // namespace peru::net

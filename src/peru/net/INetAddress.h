// Network addresses.
#pragma once

#include "peru/strings/IString.h"

#include <cstdint>
#include <span>

namespace peru::net {

class PERU_API IIPAddress : public virtual IBase {
public:
    virtual bool isIPv6() const = 0;
    // 4 or 16 bytes, most significant first, valid while the object lives.
    virtual std::span<const uint8_t> getBytes() const = 0;
    virtual uint32_t getScope() const = 0; // interface index of a link-local IPv6 address, otherwise 0
    virtual bool isLoopback() const = 0;
    virtual P<IString> getAsString() const = 0; // the usual text, without brackets
    virtual bool equals(const P<IIPAddress>& other) const = 0;
};

// An address of any kind. Factories of connections recognise theirs by its interfaces.
class PERU_API INetAddress : public virtual IBase {
public:
    virtual P<IString> getAsString() const = 0;
};

class PERU_API ITCPAddress : public virtual INetAddress {
public:
    virtual P<IIPAddress> getIPAddress() const = 0;
    virtual uint16_t getPort() const = 0;
};

} // namespace peru::net

// The system's text forms of addresses and host names.
#pragma once

#include "peru/uri/IURI.h"

#include <array>
#include <span>
#include <string>

namespace peru::net::posix {

// Returns the number of bytes of the address, 0 for any other text.
size_t parseAddress(std::string text, std::array<uint8_t, 16>& bytes, uint32_t& scope);
std::string printAddress(std::span<const uint8_t> bytes, uint32_t scope);

// The URI's host as the network knows it: unescaped, without brackets, international names in their ASCII
// form. Empty if the URI has no host or one that cannot be a name.
PERU_API std::string getNetworkHost(const P<IURI>& uri);

} // namespace peru::net::posix

// The text forms of proxy settings.
#pragma once

#include "peru/uri/IURI.h"

#include <string>
#include <string_view>

namespace peru::net {

inline constexpr int32_t kDefaultProxyPort = 8080;

// Accepts "host", "host:port" and a URI with user and password. The result always has a port: `defaultPort`
// if none is given. Empty for another kind of proxy and for invalid text.
PERU_API P<IURI> parseProxy(std::string_view text, int32_t defaultPort = kDefaultProxyPort);

// Whether the list of exceptions, separated by commas, semicolons or blanks, covers the target. An entry is a
// host with all its subdomains (".example.org" and "*.example.org" mean the same), an address, a network such
// as "10.0.0.0/8", "<local>" for all names without a dot, or "*" for everything. A port restricts an entry to
// it.
PERU_API bool isBypassed(std::string_view list, const P<IURI>& target);

} // namespace peru::net

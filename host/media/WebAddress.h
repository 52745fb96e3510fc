// Addresses of files on web servers.
#pragma once

#include <filesystem>

namespace host {

// "http://..."; a file whose name begins like that is "./http:...".
bool isWebAddress(const std::filesystem::path& file);

// The name at the end of an address, unescaped, such as "x.flac"; empty if it has none that a file could
// have.
std::filesystem::path getWebName(const std::filesystem::path& address);

} // namespace host

// Files on web servers.
#pragma once

#include "library/Library.h"
#include "media/WebAddress.h"

#include <cstdint>
#include <filesystem>
#include <functional>

namespace host {

// Bytes so far, and in total or -1.
using DownloadProgress = std::function<void(int64_t received, int64_t total)>;

// A handle for the functions of downloads in the library. Throws std::runtime_error.
CHandle createDownload(const std::filesystem::path& address);

// Writes the content of an address to a file, which is created or overwritten. False if Ctrl-C ended it; the
// file is then incomplete, as it is after a failure. Throws std::runtime_error.
bool download(const std::filesystem::path& address, const std::filesystem::path& file,
              const DownloadProgress& progress = nullptr);

} // namespace host

// An optical drive as libcdio opens it.
#pragma once

#include <cdio/cdio.h>
#include <memory>
#include <string>

namespace discio {

using CdioDevice = std::unique_ptr<CdIo_t, void (*)(CdIo_t*)>;

CdioDevice openCdioDevice(const std::string& path); // throws CDiscError

} // namespace discio

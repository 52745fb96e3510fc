#include "drives/CdioDevice.h"

#include "Error.h"

#include <cdio/logging.h>

namespace discio {

CdioDevice openCdioDevice(const std::string& path) {
    cdio_log_set_handler([](cdio_log_level_t, const char*) {}); // it would print to standard output
    CdioDevice device(cdio_open(path.c_str(), DRIVER_LINUX), cdio_destroy);
    if (!device) throw CDiscError(DISCIO_ERROR_DEVICE, path + " cannot be opened");
    return device;
}

} // namespace discio

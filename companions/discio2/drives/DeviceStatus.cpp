#include "drives/DeviceStatus.h"

#include "Error.h"

#include <cerrno>
#include <fcntl.h>
#include <linux/cdrom.h>
#include <sys/ioctl.h>
#include <system_error>
#include <unistd.h>

namespace discio {

CDeviceDescriptor::CDeviceDescriptor(const std::string& path)
    : m_file(::open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC)) {
    if (m_file < 0)
        throw CDiscError(DISCIO_ERROR_DEVICE, path + ": " + std::generic_category().message(errno));
}

CDeviceDescriptor::~CDeviceDescriptor() {
    ::close(m_file);
}

int getDeviceStatus(const std::string& path) {
    const CDeviceDescriptor device(path);
    return ::ioctl(device.get(), CDROM_DRIVE_STATUS, CDSL_CURRENT);
}

} // namespace discio

// The state of an optical drive, as the kernel reports it.
#pragma once

#include <string>

namespace discio {

// Owns a descriptor of a drive, with or without a medium.
class CDeviceDescriptor {
public:
    explicit CDeviceDescriptor(const std::string& path); // throws CDiscError
    ~CDeviceDescriptor();
    CDeviceDescriptor(const CDeviceDescriptor&) = delete;
    CDeviceDescriptor& operator=(const CDeviceDescriptor&) = delete;
    int get() const { return m_file; }

private:
    int m_file;
};

// A value of the ioctl CDROM_DRIVE_STATUS. Throws CDiscError.
int getDeviceStatus(const std::string& path);

} // namespace discio

// Optical drives.
#include "drives/DeviceMedium.h"
#include "drives/DeviceStatus.h"
#include "drives/Drives.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstdio>
#include <fstream>
#include <libudev.h>
#include <linux/cdrom.h>
#include <sstream>
#include <sys/ioctl.h>
#include <system_error>
#include <thread>

namespace discio {

namespace {

constexpr auto kPollInterval = std::chrono::milliseconds(50);

class CDeviceDrive : public IDrive {
public:
    CDeviceDrive(const std::string& path, const std::string& name, const std::string& revision)
        : m_path(path), m_name(name), m_revision(revision) {}

    std::string getName() const override { return m_name; }
    std::string getPath() const override { return m_path; }
    std::string getRevision() const override { return m_revision; }
    std::string getDriverDescription() const override { return "optical drive"; }
    bool isOptical() const override { return true; }

    // The kernel knows the fastest speed only.
    std::vector<double> getReadSpeeds() const override {
        std::ifstream info("/proc/sys/dev/cdrom/info");
        const std::string own = m_path.substr(m_path.rfind('/') + 1);
        size_t column = std::string::npos;
        for (std::string line; std::getline(info, line);) {
            std::istringstream words(line.substr(std::min(line.find(':') + 1, line.size())));
            std::vector<std::string> values;
            for (std::string word; words >> word;) values.push_back(word);
            if (line.starts_with("drive name:"))
                column = static_cast<size_t>(std::find(values.begin(), values.end(), own) - values.begin());
            else if (line.starts_with("drive speed:") && column < values.size())
                if (const double speed = std::strtod(values[column].c_str(), nullptr); speed > 0)
                    return {speed};
        }
        return {};
    }

    bool checkMedium(int milliseconds) override {
        const auto due = std::chrono::steady_clock::now() + std::chrono::milliseconds(milliseconds);
        while (true) {
            const int status = getDeviceStatus(m_path);
            if (status == CDS_DISC_OK) return true;
            if (status != CDS_DRIVE_NOT_READY || std::chrono::steady_clock::now() >= due) return false;
            std::this_thread::sleep_for(kPollInterval);
        }
    }

    std::shared_ptr<IMedium> openMedium() override { return openDeviceMedium(m_path); }

    void moveTray(bool open) override {
        const CDeviceDescriptor device(m_path);
        if (::ioctl(device.get(), open ? CDROMEJECT : CDROMCLOSETRAY, 0) == 0) return;
        throw CDiscError(errno == ENOSYS || errno == EOPNOTSUPP ? DISCIO_ERROR_NOT_SUPPORTED
                                                                : DISCIO_ERROR_DEVICE,
                         m_path + ": " + std::generic_category().message(errno));
    }

private:
    const std::string m_path;
    const std::string m_name;
    const std::string m_revision;
};

std::string getProperty(udev_device* device, const char* name) {
    const char* value = udev_device_get_property_value(device, name);
    std::string text = value ? value : "";
    std::replace(text.begin(), text.end(), '_', ' '); // udev's form of spaces
    return text;
}

} // namespace

Drives findDeviceDrives() {
    Drives drives;
    const std::unique_ptr<udev, udev* (*)(udev*)> context(udev_new(), udev_unref);
    if (!context) return drives;
    const std::unique_ptr<udev_enumerate, udev_enumerate* (*)(udev_enumerate*)> search(
        udev_enumerate_new(context.get()), udev_enumerate_unref);
    if (!search) return drives;
    udev_enumerate_add_match_subsystem(search.get(), "block");
    udev_enumerate_add_match_property(search.get(), "ID_CDROM", "1");
    udev_enumerate_scan_devices(search.get());
    udev_list_entry* entry = nullptr;
    udev_list_entry_foreach(entry, udev_enumerate_get_list_entry(search.get())) {
        const std::unique_ptr<udev_device, udev_device* (*)(udev_device*)> device(
            udev_device_new_from_syspath(context.get(), udev_list_entry_get_name(entry)), udev_device_unref);
        const char* node = device ? udev_device_get_devnode(device.get()) : nullptr;
        if (!node) continue;
        std::string name = getProperty(device.get(), "ID_VENDOR");
        const std::string model = getProperty(device.get(), "ID_MODEL");
        name += name.empty() || model.empty() ? model : " " + model;
        drives.push_back(
            std::make_shared<CDeviceDrive>(node, name, getProperty(device.get(), "ID_REVISION")));
    }
    return drives;
}

} // namespace discio

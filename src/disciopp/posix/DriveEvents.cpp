#include "disciopp/posix/DriveEvents.h"

#include "disciopp/Discio.h"
#include "peru/Errors.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/ITimeManager.h"

#include <array>
#include <cerrno>
#include <filesystem>
#include <libudev.h>
#include <map>
#include <poll.h>
#include <sys/eventfd.h>
#include <sys/inotify.h>
#include <system_error>
#include <unistd.h>

namespace disciopp::posix {

namespace {

using peru::CString;

template <class T, T* (*unref)(T*)> struct SUnref {
    void operator()(T* object) const { unref(object); }
};
using Udev = std::unique_ptr<udev, SUnref<udev, udev_unref>>;
using Monitor = std::unique_ptr<udev_monitor, SUnref<udev_monitor, udev_monitor_unref>>;
using Device = std::unique_ptr<udev_device, SUnref<udev_device, udev_device_unref>>;

class CDescriptor {
public:
    explicit CDescriptor(int file) : m_file(file) {
        if (m_file < 0)
            throw peru::CError(peru::format("The drives cannot be watched: %s",
                                            CString::fromUTF8(std::generic_category().message(errno))));
    }
    ~CDescriptor() { ::close(m_file); }
    CDescriptor(const CDescriptor&) = delete;
    CDescriptor& operator=(const CDescriptor&) = delete;
    int get() const { return m_file; }

private:
    int m_file;
};

bool hasProperty(udev_device* device, const char* name) {
    const char* value = udev_device_get_property_value(device, name);
    return value && std::string_view(value) != "0";
}

class CDriveEvents : public IDriveEvents {
public:
    CDriveEvents()
        : m_inotify(::inotify_init1(IN_NONBLOCK | IN_CLOEXEC)),
          m_wake(::eventfd(0, EFD_NONBLOCK | EFD_CLOEXEC)), m_udev(udev_new()) {
        if (!m_udev) return; // folders are watched all the same
        m_monitor.reset(udev_monitor_new_from_netlink(m_udev.get(), "udev"));
        if (!m_monitor) return;
        udev_monitor_filter_add_match_subsystem_devtype(m_monitor.get(), "block", nullptr);
        if (udev_monitor_enable_receiving(m_monitor.get()) < 0) m_monitor.reset();
    }

    void watch(const std::vector<std::string>& drives) override {
        for (const std::string& drive : drives) {
            std::error_code none;
            if (std::filesystem::is_directory(drive, none)) {
                constexpr uint32_t kMask =
                    IN_CLOSE_WRITE | IN_MOVED_TO | IN_MOVED_FROM | IN_DELETE | IN_CREATE | IN_ONLYDIR;
                const int watched = ::inotify_add_watch(m_inotify.get(), drive.c_str(), kMask);
                if (watched >= 0) m_folders[watched] = drive;
                m_hasMedium[drive] = hasImage(drive);
            } else {
                m_hasMedium[drive] = hasMedium(drive);
            }
        }
    }

    std::vector<SMediumEvent> wait(int milliseconds) override {
        std::array<pollfd, 3> files{{{m_wake.get(), POLLIN, 0},
                                     {m_inotify.get(), POLLIN, 0},
                                     {m_monitor ? udev_monitor_get_fd(m_monitor.get()) : -1, POLLIN, 0}}};
        std::vector<SMediumEvent> events;
        if (::poll(files.data(), files.size(), milliseconds) <= 0) return events;
        if (files[0].revents) {
            uint64_t count = 0;
            static_cast<void>(!::read(m_wake.get(), &count, sizeof count));
        }
        if (files[1].revents) readFolders(events);
        if (files[2].revents) readDevices(events);
        return events;
    }

    void wake() override {
        const uint64_t one = 1;
        static_cast<void>(!::write(m_wake.get(), &one, sizeof one));
    }

    int64_t getTime() override { return peru::getTimeManager()->getMonotonicTime() / 1'000'000; }

private:
    void change(std::vector<SMediumEvent>& events, const std::string& drive, bool hasMediumNow) {
        const auto known = m_hasMedium.find(drive);
        if (known == m_hasMedium.end() || known->second == hasMediumNow) return; // no drive, or no change
        known->second = hasMediumNow;
        events.push_back({drive, hasMediumNow});
    }

    void readFolders(std::vector<SMediumEvent>& events) {
        alignas(inotify_event) std::array<char, 4096> bytes;
        std::map<std::string, bool> touched;
        for (ssize_t size; (size = ::read(m_inotify.get(), bytes.data(), bytes.size())) > 0;)
            for (ssize_t at = 0; at < size;) {
                const auto* event = reinterpret_cast<const inotify_event*>(bytes.data() + at);
                at += static_cast<ssize_t>(sizeof(inotify_event) + event->len);
                if (const auto folder = m_folders.find(event->wd); folder != m_folders.end())
                    touched[folder->second] = true;
                else if (event->mask & IN_Q_OVERFLOW)
                    for (const auto& each : m_folders) touched[each.second] = true;
            }
        for (const auto& [folder, none] : touched) change(events, folder, hasImage(folder));
    }

    void readDevices(std::vector<SMediumEvent>& events) {
        while (const Device device{udev_monitor_receive_device(m_monitor.get())}) {
            const char* node = udev_device_get_devnode(device.get());
            const char* action = udev_device_get_action(device.get());
            if (!node || !action) continue;
            const bool isGone = std::string_view(action) == "remove";
            const bool hasMediumNow = !isGone && hasProperty(device.get(), "ID_CDROM_MEDIA");
            // The kernel looks every few seconds, and misses the time between two discs.
            if (hasMediumNow && hasProperty(device.get(), "DISK_MEDIA_CHANGE")) change(events, node, false);
            change(events, node, hasMediumNow);
        }
    }

    // As udev knows it: the drive itself is not touched.
    bool hasMedium(const std::string& node) const {
        if (!m_udev) return false;
        const std::string name = node.substr(node.rfind('/') + 1);
        const Device device(udev_device_new_from_subsystem_sysname(m_udev.get(), "block", name.c_str()));
        return device && hasProperty(device.get(), "ID_CDROM_MEDIA");
    }

    static bool hasImage(const std::string& folder) {
        DISCIO_Library* library = getDiscio();
        for (int32_t i = 0; i < DISCIO_GetDriveCount(library); ++i) {
            const Handle<DISCIO_Drive> drive(DISCIO_OpenDrive(library, i));
            if (drive && CString::toStdString(peru::newString(DISCIO_DriveGetPathW(drive.get()))) == folder)
                return DISCIO_DriveCheckDisc(drive.get(), 0, 0) == 1;
        }
        return false;
    }

    CDescriptor m_inotify;
    CDescriptor m_wake;
    Udev m_udev;
    Monitor m_monitor; // empty where udev does not run
    std::map<int, std::string> m_folders;
    std::map<std::string, bool> m_hasMedium; // by the drive's path
};

} // namespace

std::unique_ptr<IDriveEvents> createDriveEvents() {
    return std::make_unique<CDriveEvents>();
}

} // namespace disciopp::posix

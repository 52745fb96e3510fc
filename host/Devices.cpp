#include "Devices.h"
#include "ExitCodes.h"

#include "Cancel.h"
#include "Commands.h"
#include "Text.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <string_view>
#include <tonewright/host.h>
#include <unistd.h>

namespace host {

namespace {

// Writes everything except the sound engine's own lines to standard error.
ssize_t writeUnlessEngines(void*, const char* data, size_t size) {
    if (std::string_view(data, size).starts_with("Expression '")) return static_cast<ssize_t>(size);
    for (size_t done = 0; done < size;) {
        const ssize_t written = ::write(STDERR_FILENO, data + done, size - done);
        if (written < 0 && errno != EINTR) return 0;
        if (written > 0) done += static_cast<size_t>(written);
    }
    return static_cast<ssize_t>(size);
}

// The engine also prints the source line of each error that it returns, on its own threads, and has no option
// to turn that off. Only the stream is replaced, not the file descriptor.
void hushEngine() {
    static FILE* const s_filter = [] {
        cookie_io_functions_t functions = {};
        functions.write = writeUnlessEngines;
        return ::fopencookie(nullptr, "w", functions);
    }();
    if (!s_filter || stderr == s_filter) return;
    std::setvbuf(s_filter, nullptr, _IOLBF, BUFSIZ);
    stderr = s_filter;
}

// An unreachable sound system counts as a missing device.
[[noreturn]] void throwUnreachable() {
    TONEWRIGHT_Failure failure = {};
    failure.size = sizeof failure;
    TONEWRIGHT_Host_GetLastFailure(&failure);
    throw CNoDevice("The sound system cannot be reached: " + std::string(failure.message));
}

class CDeviceList {
public:
    explicit CDeviceList(int32_t direction) {
        hushEngine();
        m_list = CHandle(TONEWRIGHT_Host_ListDevices(direction));
        if (!m_list) throwUnreachable();
    }
    int32_t getCount() const { return TONEWRIGHT_Host_GetDeviceCount(m_list.get()); }
    TONEWRIGHT_DeviceInfo get(int32_t index) const {
        TONEWRIGHT_DeviceInfo info = {};
        info.size = sizeof info;
        TONEWRIGHT_Host_GetDevice(m_list.get(), index, &info);
        return info;
    }

private:
    CHandle m_list;
};

void print(const TONEWRIGHT_DeviceInfo& device, const char* direction, bool json) {
    if (json)
        std::printf("%s\n", toLine({{"direction", direction},
                                    {"id", device.id},
                                    {"name", device.name},
                                    {"api", device.api},
                                    {"channels", device.channelCount},
                                    {"default", device.isDefault != 0}})
                                .c_str());
    else
        std::printf("%-9s %4s %-8s %9d  %-10s  %s\n", direction, device.id, device.isDefault ? "default" : "",
                    device.channelCount, device.api, toPrintable(device.name).c_str());
}

} // namespace

void printNoDevice(const CNoDevice& failure) {
    std::printf("%s\n", toLine({{"event", "error"}, {"message", failure.what()}}).c_str());
    flushEvents();
}

void requireOutDevice() {
    // Playing files does not need low latency, and with the low latency that the device requests, a busy
    // machine causes gaps. A latency above one chunk of sound causes a gap at the beginning, and from 150 ms
    // on the server reports a delay that is too short, so that the last samples may be cut off.
    ::setenv("PULSE_LATENCY_MSEC", "100", 0);
    const CDeviceList devices(TONEWRIGHT_DEVICE_OUTPUT);
    for (int32_t i = 0; i < devices.getCount(); ++i)
        if (devices.get(i).isDefault) return;
    throw CNoDevice("There is no sound device to play on");
}

CHandle openInDevice(const std::string& id) {
    if (CDeviceList(TONEWRIGHT_DEVICE_INPUT).getCount() == 0)
        throw CNoDevice("There is no sound device to record from");
    CHandle device(TONEWRIGHT_Host_OpenInputDevice(id.c_str()));
    if (device) return device;
    if (id.empty()) throw CNoDevice("There is no sound device to record from");
    throw CNoDevice("There is no input device " + toPrintable(id) + "; tonewright devices lists them");
}

int listDevices(bool json) {
    const CDeviceList outs(TONEWRIGHT_DEVICE_OUTPUT), ins(TONEWRIGHT_DEVICE_INPUT);
    if (outs.getCount() == 0 && ins.getCount() == 0) throw CNoDevice("There is no sound device");
    if (!json)
        std::printf("%-9s %4s %-8s %9s  %-10s  %s\n", "direction", "id", "", "channels", "host API", "name");
    for (int32_t i = 0; i < outs.getCount(); ++i) print(outs.get(i), "output", json);
    for (int32_t i = 0; i < ins.getCount(); ++i) print(ins.get(i), "input", json);
    flushOutput();
    return kExitSuccess;
}

} // namespace host

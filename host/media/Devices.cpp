#include "media/Devices.h"

#include "base/Text.h"
#include "base/Translation.h"
#include "terminal/Progress.h"

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
    throw CNoDevice(tr("host.Devices.unreachable", "The sound system cannot be reached: %REASON%",
                       {{"%REASON%", failure.message}}));
}

} // namespace

std::vector<SDevice> readDevices(int32_t direction) {
    hushEngine();
    const CHandle list(TONEWRIGHT_Host_ListDevices(direction));
    if (!list) throwUnreachable();
    std::vector<SDevice> devices;
    for (int32_t i = 0; i < TONEWRIGHT_Host_GetDeviceCount(list.get()); ++i) {
        TONEWRIGHT_DeviceInfo info = {};
        info.size = sizeof info;
        if (TONEWRIGHT_Host_GetDevice(list.get(), i, &info) != 1) continue;
        devices.push_back({info.id, info.name, info.api, info.channelCount, info.isDefault != 0});
    }
    return devices;
}

void printNoDevice(const CNoDevice& failure) {
    std::printf("%s\n", toLine({{"event", "error"}, {"message", failure.what()}}).c_str());
    flushEvents();
}

void requireOutDevice() {
    // Playing files does not need low latency, and with the low latency that the device requests, a busy
    // machine causes gaps. A latency above one chunk of sound causes a gap at the beginning, and from 150 ms
    // on the server reports a delay that is too short, so that the last samples may be cut off.
    ::setenv("PULSE_LATENCY_MSEC", "100", 0);
    findDefaultOutDevice();
}

SDevice findDefaultOutDevice() {
    for (const SDevice& device : readDevices(TONEWRIGHT_DEVICE_OUTPUT))
        if (device.isDefault) return device;
    throw CNoDevice(tr("host.Devices.noOutput", "There is no sound device to play on"));
}

SDevice findOutDevice(const std::string& idOrName) {
    const std::vector<SDevice> devices = readDevices(TONEWRIGHT_DEVICE_OUTPUT);
    if (devices.empty()) throw CNoDevice(tr("host.Devices.noOutput", "There is no sound device to play on"));
    for (const auto member : {&SDevice::id, &SDevice::name})
        for (const SDevice& device : devices)
            if (device.*member == idOrName) return device;
    throw CNoDevice(tr("host.Devices.noSuchOutput",
                       "There is no output device %NAME%; tonewright devices lists them",
                       {{"%NAME%", toPrintable(idOrName)}}));
}

CHandle openInDevice(const std::string& id) {
    if (readDevices(TONEWRIGHT_DEVICE_INPUT).empty())
        throw CNoDevice(tr("host.Devices.noInput", "There is no sound device to record from"));
    CHandle device(TONEWRIGHT_Host_OpenInputDevice(id.c_str()));
    if (device) return device;
    if (id.empty()) throw CNoDevice(tr("host.Devices.noInput", "There is no sound device to record from"));
    throw CNoDevice(tr("host.Devices.noSuchInput",
                       "There is no input device %NAME%; tonewright devices lists them",
                       {{"%NAME%", toPrintable(id)}}));
}

} // namespace host

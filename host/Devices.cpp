#include "Devices.h"

#include "Cancel.h"
#include "Commands.h"
#include "Text.h"
#include "peru/media/Errors.h"
#include "peru/media/ISystem.h"
#include "peru/strings/String.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <string_view>
#include <unistd.h>
#include <utility>

namespace host {

using peru::P;
using peru::media::IAudioDevice;
using peru::media::IAudioInDevice;
using peru::media::IAudioOutDevice;

namespace {

std::string toText(const P<peru::IString>& text) {
    return text ? peru::CString::toStdString(text) : std::string();
}

// What of a line is not the sound engine's goes to standard error.
ssize_t writeUnlessEngines(void*, const char* data, size_t size) {
    if (std::string_view(data, size).starts_with("Expression '")) return static_cast<ssize_t>(size);
    for (size_t done = 0; done < size;) {
        const ssize_t written = ::write(STDERR_FILENO, data + done, size - done);
        if (written < 0 && errno != EINTR) return 0;
        if (written > 0) done += static_cast<size_t>(written);
    }
    return static_cast<ssize_t>(size);
}

// The engine prints the source line of each error that it returns as well, on threads of its own, and cannot
// be told not to. The descriptor stays what it is for everybody else.
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

// A sound system that cannot be reached has no devices.
template <class Operation> auto ask(Operation operation) {
    hushEngine();
    try {
        return operation(*peru::media::getSystem());
    } catch (const peru::CException& error) {
        throw CNoDevice("The sound system cannot be reached: " + toText(error.getDescription()));
    }
}

void print(const IAudioDevice& device, const char* direction, bool json) {
    const std::string id = toText(device.getId()), api = toText(device.getHostApi()),
                      name = toText(device.getName());
    if (json)
        std::printf("%s\n", toLine({{"direction", direction},
                                    {"id", id},
                                    {"name", name},
                                    {"api", api},
                                    {"channels", device.getMaxChannelCount()},
                                    {"default", device.isDefault()}})
                                .c_str());
    else
        std::printf("%-9s %4s %-8s %9d  %-10s  %s\n", direction, id.c_str(),
                    device.isDefault() ? "default" : "", device.getMaxChannelCount(), api.c_str(),
                    toPrintable(name).c_str());
}

} // namespace

void requireOutDevice() {
    // What plays files has no need to answer within milliseconds, and with the few that the device asks for a
    // busy machine lets gaps in. With more than a chunk of sound the beginning has one, and from 150 on the
    // server's delay is told too short, so that the last samples may be cut off.
    ::setenv("PULSE_LATENCY_MSEC", "100", 0);
    if (!ask([](auto& system) { return system.getDefaultOutDevice(); }))
        throw CNoDevice("There is no sound device to play on");
}

P<IAudioInDevice> findInDevice(const std::string& id) {
    return ask([&](auto& system) {
        // Where none is the default one, others may still be named.
        peru::WEnum<IAudioInDevice> devices = system.getInDevices();
        P<IAudioInDevice> device = id.empty() ? system.getDefaultInDevice() : nullptr;
        if (id.empty() ? !device : !devices.hasMore())
            throw CNoDevice("There is no sound device to record from");
        if (device) return device;
        while (devices.hasMore()) {
            device = devices.getNext();
            if (toText(device->getId()) == id) return device;
        }
        throw CNoDevice("There is no input device " + toPrintable(id) + "; tonewright devices lists them");
    });
}

int listDevices(bool json) {
    const auto [outs, ins] =
        ask([](auto& system) { return std::pair(system.getOutDevices(), system.getInDevices()); });
    if (!outs.hasMore() && !ins.hasMore()) throw CNoDevice("There is no sound device");
    if (!json)
        std::printf("%-9s %4s %-8s %9s  %-10s  %s\n", "direction", "id", "", "channels", "host API", "name");
    for (auto devices = outs; devices.hasMore();) print(*devices.getNext(), "output", json);
    for (auto devices = ins; devices.hasMore();) print(*devices.getNext(), "input", json);
    flushOutput();
    return kExitSuccess;
}

} // namespace host

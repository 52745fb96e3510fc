#include "commands/ListDevices.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "media/Devices.h"
#include "terminal/Progress.h"

#include <cstdio>
#include <tonewright/host.h>

namespace host {

namespace {

void print(const SDevice& device, const char* direction, bool json) {
    if (json)
        std::printf("%s\n", toLine({{"direction", direction},
                                    {"id", device.id},
                                    {"name", device.name},
                                    {"api", device.api},
                                    {"channels", device.channels},
                                    {"default", device.isDefault}})
                                .c_str());
    else
        std::printf("%-9s %4s %-8s %9d  %-10s  %s\n", direction, device.id.c_str(),
                    device.isDefault ? "default" : "", device.channels, device.api.c_str(),
                    toPrintable(device.name).c_str());
}

} // namespace

int listDevices(bool json) {
    const std::vector<SDevice> outs = readDevices(TONEWRIGHT_DEVICE_OUTPUT);
    const std::vector<SDevice> ins = readDevices(TONEWRIGHT_DEVICE_INPUT);
    if (outs.empty() && ins.empty()) throw CNoDevice("There is no sound device");
    if (!json)
        std::printf("%-9s %4s %-8s %9s  %-10s  %s\n", "direction", "id", "", "channels", "host API", "name");
    for (const SDevice& device : outs) print(device, "output", json);
    for (const SDevice& device : ins) print(device, "input", json);
    flushOutput();
    return kExitSuccess;
}

} // namespace host

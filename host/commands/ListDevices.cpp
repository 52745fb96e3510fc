#include "commands/ListDevices.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "media/Devices.h"
#include "terminal/Progress.h"

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <nlohmann/json.hpp>
#include <string_view>
#include <thread>
#include <tonewright/host.h>

namespace host {

namespace {

// The sound system has no notification; asking it takes some tens of milliseconds.
constexpr auto kWatchInterval = std::chrono::milliseconds(1000);
constexpr auto kPollInterval = std::chrono::milliseconds(50);

struct SListed {
    const char* direction;
    SDevice device;

    // Whether it is the same device in the same role. Ids change when other devices come and go.
    bool operator==(const SListed& other) const {
        return std::string_view(direction) == other.direction && device.name == other.device.name &&
               device.api == other.device.api && device.isDefault == other.device.isDefault;
    }
};

std::string translate(std::string_view word) {
    if (word == "output") return tr("host.Devices.output", "output");
    if (word == "input") return tr("host.Devices.input", "input");
    if (word == "present") return tr("host.Devices.present", "present");
    if (word == "added") return tr("host.Devices.added", "added");
    return tr("host.Devices.removed", "removed");
}

void print(const SDevice& device, const char* direction, bool json, const char* event = nullptr) {
    if (json) {
        nlohmann::json line = {{"direction", direction},      {"id", device.id},
                               {"name", device.name},         {"api", device.api},
                               {"channels", device.channels}, {"default", device.isDefault}};
        if (event) line["event"] = event;
        std::printf("%s\n", toLine(line).c_str());
        return;
    }
    if (event) std::printf("%s ", fitColumns(translate(event), 8).c_str());
    std::printf("%s %4s %s %9d  %-10s  %s\n", fitColumns(translate(direction), 9).c_str(), device.id.c_str(),
                fitColumns(device.isDefault ? tr("host.Devices.default", "default") : "", 8).c_str(),
                device.channels, device.api.c_str(), toPrintable(device.name).c_str());
}

// A sound system that cannot be reached has no devices at present.
std::vector<SListed> readListed() {
    std::vector<SListed> listed;
    try {
        for (SDevice& device : readDevices(TONEWRIGHT_DEVICE_OUTPUT))
            listed.push_back({"output", std::move(device)});
        for (SDevice& device : readDevices(TONEWRIGHT_DEVICE_INPUT))
            listed.push_back({"input", std::move(device)});
    } catch (const CNoDevice&) {
        listed.clear();
    }
    return listed;
}

// Prints what is in `now` and not in `before`; of several equal devices as many as there are more.
void printDifference(const std::vector<SListed>& now, std::vector<SListed> before, bool json,
                     const char* event) {
    for (const SListed& listed : now) {
        const auto found = std::find(before.begin(), before.end(), listed);
        if (found == before.end())
            print(listed.device, listed.direction, json, event);
        else
            before.erase(found);
    }
}

} // namespace

int listDevices(bool json) {
    const std::vector<SDevice> outs = readDevices(TONEWRIGHT_DEVICE_OUTPUT);
    const std::vector<SDevice> ins = readDevices(TONEWRIGHT_DEVICE_INPUT);
    if (outs.empty() && ins.empty()) throw CNoDevice(tr("host.Devices.none", "There is no sound device"));
    if (!json)
        std::printf("%s\n",
                    tr("host.Devices.header", "direction   id           channels  host API    name").c_str());
    for (const SDevice& device : outs) print(device, "output", json);
    for (const SDevice& device : ins) print(device, "input", json);
    flushOutput();
    return kExitSuccess;
}

int watchDevices(bool json) {
    std::vector<SListed> known;
    for (const char* event = "present"; !isCancelled(); event = "added") {
        const std::vector<SListed> now = readListed();
        printDifference(known, now, json, "removed");
        printDifference(now, known, json, event);
        if (!flushOutput()) break;
        known = now;
        const auto due = std::chrono::steady_clock::now() + kWatchInterval;
        while (!isCancelled() && std::chrono::steady_clock::now() < due)
            std::this_thread::sleep_for(kPollInterval);
    }
    return kExitSuccess;
}

} // namespace host

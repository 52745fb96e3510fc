#include "commands/Drives.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "media/Disc.h"
#include "terminal/Progress.h"

#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <deque>
#include <mutex>

namespace host {

namespace {

constexpr auto kPollInterval = std::chrono::milliseconds(50);

struct SEvent {
    std::string path;
    int32_t event;
};

// The callback has no user data.
std::mutex s_mutex;
std::deque<SEvent> s_events; // guarded by the mutex
std::condition_variable s_arrived;

void onDriveChanged(void* drive, int32_t event) {
    const std::string path = toUTF8(getDiscFunctions().DriveGetPathW(static_cast<DISCIO_Drive*>(drive)));
    std::lock_guard lock(s_mutex);
    s_events.push_back({path, event});
    s_arrived.notify_one();
}

// The names of the events for programs.
const char* getName(int32_t event) {
    switch (event) {
    case 1:
        return "arrived";
    case 2:
        return "not ready";
    case 3:
        return "ready";
    case 4:
        return "removed";
    default:
        return "unknown";
    }
}

std::string describe(int32_t event) {
    switch (event) {
    case 1:
        return tr("host.Drives.arrived", "arrived");
    case 2:
        return tr("host.Drives.notReady", "not ready");
    case 3:
        return tr("host.Drives.ready", "ready");
    case 4:
        return tr("host.Drives.removed", "removed");
    default:
        return tr("host.Drives.unknown", "unknown");
    }
}

// JSON is not translated.
std::string describeState(const SDrive& drive, bool json) {
    const SDiscFunctions& functions = getDiscFunctions();
    if (functions.DriveCheckDisc(drive.handle.get(), 1000, 0) != 1) return "";
    const DiscHandle<DISCIO_Disc> disc(functions.DriveOpenDisc(drive.handle.get()));
    if (disc) return describeMedium(functions.DiscGetMediumType(disc.get()));
    return json ? "unreadable" : tr("host.Drives.unreadable", "unreadable");
}

} // namespace

int listDrives(bool json) {
    const std::vector<SDrive> drives = findDrives();
    if (drives.empty() && !json)
        std::fprintf(stderr, "tonewright: %s\n", tr("host.Disc.noDrive", "There is no drive").c_str());
    if (!drives.empty() && !json)
        std::printf("%-24s %-10s %-10s  %s\n", tr("host.Drives.drive", "drive").c_str(),
                    tr("host.Drives.disc", "disc").c_str(), tr("host.Drives.revision", "revision").c_str(),
                    tr("host.Drives.name", "name").c_str());
    for (const SDrive& drive : drives) {
        const std::string medium = describeState(drive, json);
        if (json)
            std::printf("%s\n", toLine({{"drive", drive.path},
                                        {"name", drive.name},
                                        {"revision", drive.revision},
                                        {"disc", medium}})
                                    .c_str());
        else
            std::printf("%-24s %-10s %-10s  %s\n", toPrintable(drive.path).c_str(),
                        medium.empty() ? "-" : medium.c_str(), toPrintable(drive.revision).c_str(),
                        toPrintable(drive.name).c_str());
    }
    flushOutput();
    return kExitSuccess;
}

int watchDrives(CLibrary& library, bool json) {
    listDrives(json);
    library.SetDriveChangedCallback(onDriveChanged);
    bool isRead = true;
    while (isRead && !isCancelled()) {
        std::deque<SEvent> events;
        {
            std::unique_lock lock(s_mutex);
            s_arrived.wait_for(lock, kPollInterval, [] { return !s_events.empty(); });
            events.swap(s_events);
        }
        for (const SEvent& event : events) {
            if (json)
                std::printf("%s\n", toLine({{"event", getName(event.event)}, {"drive", event.path}}).c_str());
            else
                std::printf("%-10s %s\n", describe(event.event).c_str(), toPrintable(event.path).c_str());
        }
        if (!events.empty()) isRead = flushOutput();
    }
    library.SetDriveChangedCallback(nullptr);
    return kExitSuccess;
}

} // namespace host

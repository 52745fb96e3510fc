// Events of a faked drive as the host receives them. The case runs in a process of its own under
// umockdev-wrapper.
#include "discio2/FakeDrive.h"
#include "support/Environment.h"
#include "tonewright/discio2.h"
#include "tonewright/tonewright.h"

#include <atomic>
#include <chrono>
#include <gtest/gtest.h>
#include <thread>

using namespace tests;

namespace {

std::atomic<int> s_seen{0}; // as decimal digits

void onDriveChanged(void* drive, int32_t event) {
    s_seen =
        s_seen * 10 +
        (std::u16string(DISCIO_DriveGetPathW(static_cast<DISCIO_Drive*>(drive))) == u"/dev/sr0" ? event : 9);
}

// The events so far, once they are those or after 20 seconds.
int waitFor(int expected) {
    const auto due = std::chrono::steady_clock::now() + std::chrono::seconds(20);
    while (s_seen != expected && std::chrono::steady_clock::now() < due)
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
    return s_seen;
}

} // namespace

// Run by the test below.
TEST(DISABLED_DriveEvents, ReachTheHostInOrder) {
    CFakeDrive fake;
    const CEnvironment environment("TONEWRIGHT_DRIVE_FOLDERS", "");
    fakeDisc().isPresent = false;
    fakeDisc().starts = {0, 100};
    fakeDisc().samples.resize(100 * 2352);
    ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK);
    TONEWRIGHT_SetDriveChangedCallback(onDriveChanged);
    fakeDisc().isPresent = true;
    fake.announce("sdb", true); // a stick
    fake.announce("sr0", true);
    EXPECT_EQ(waitFor(13), 13);
    fake.announce("sr0", true, false); // nothing has changed
    fake.announce("sr0", true);        // another disc
    EXPECT_EQ(waitFor(13413), 13413);
    fakeDisc().isPresent = false;
    fake.announce("sr0", false);
    fake.announce("sdb", false);
    EXPECT_EQ(waitFor(134134), 134134);
    TONEWRIGHT_SetDriveChangedCallback(nullptr);
    TONEWRIGHT_DeInitAll();
}

TEST(DriveEvents, OfAFakedDriveReachTheHost) {
    runWithFakeDrive({"DriveEvents.*"});
}

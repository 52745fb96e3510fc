// Ripping from a faked drive. The case runs in a process of its own under umockdev-wrapper.
#include "discio2/DiscSupport.h"
#include "discio2/FakeDrive.h"
#include "host/Program.h"

using namespace tests;

using DISABLED_Rip = CProgramTest;

// Run by the test below.
TEST_F(DISABLED_Rip, IsExactOrLeavesNothing) {
    const CFakeDrive fake;
    fakeDisc().starts = {0, 60, 140};
    fakeDisc().samples = makeSectors(140, 3);
    fakeDisc().failures = {{20, 2}, {100, 1}};
    const auto lines = parseLines(succeed({"rip", "/dev/sr0", "--to", "wav", "--verify", "--json"}));
    int repairs = 0;
    for (const auto& line : lines) repairs += line.value("repairs", 0);
    EXPECT_GT(repairs, 0);
    EXPECT_TRUE(peer({"sox", "02 Track 2.wav", "-t", "raw", "-L", "-"}) ==
                fakeDisc().samples.substr(60 * kSectorBytes));
    const auto expectNothingFrom = [&](const std::string& reason) {
        const std::string message = fail({"rip", "/dev/sr0", "2", "-d", "lost", "-q"});
        EXPECT_NE(message.find(reason), std::string::npos) << message;
        EXPECT_EQ(countEntries(folder / "lost"), 0u);
    };
    fakeDisc().badBlock = 90;
    expectNothingFrom("block 90 of track 2 cannot be read");
    fakeDisc().badBlock = -1;
    fakeDisc().readsUntilOpened = 4;
    expectNothingFrom("/dev/sr0 has been taken out or exchanged");
    EXPECT_NE(fail({"rip", "/dev/sr0"}).find("There is no disc"), std::string::npos);
}

TEST(Rip, AFakedDriveIsCopied) {
    runWithFakeDrive({"Rip.*"});
}

// Burning with the program and a faked drive. The cases run in processes of their own under umockdev-wrapper.
#include "discio2/DiscSupport.h"
#include "discio2/FakeBurner.h"
#include "host/Program.h"

#include <chrono>
#include <thread>

using namespace tests;

namespace {

class DISABLED_Burn : public CProgramTest {
protected:
    DISABLED_Burn() {
        folder.write("1.wav", toWave(makeSectors(310, 1)));
        folder.write("2.wav", toWave(makeSectors(320, 2)));
    }
    std::vector<nlohmann::json> burn(std::vector<std::string> arguments) {
        arguments.insert(arguments.begin(), {"burn", "--drive", "/dev/sr0", "--json"});
        return parseLines(succeed(arguments));
    }
    // Writing itself takes the progress from 0.1 to 0.8.
    static bool waitForWriting(const CProcess& process) {
        const auto due = std::chrono::steady_clock::now() + std::chrono::seconds(60);
        while (std::chrono::steady_clock::now() < due) {
            const std::string out = process.readOut();
            for (const auto& line : parseLines(out.substr(0, out.rfind('\n') + 1)))
                if (line.value("fraction", 0.0) > 0.1) return true;
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
        }
        return false;
    }

    const CFakeBurner fake;
};

} // namespace

TEST_F(DISABLED_Burn, Audio) {
    peer({"flac", "-s", "-T", "TITLE=Ein Lied", "2.wav", "-o", "2.flac"});
    const auto before = list();
    const auto lines = burn({"1.wav", "2.flac", "--cd-text", "--title", "Platte", "--speed", "8"});
    double fraction = 0;
    for (const auto& line : lines) {
        EXPECT_GE(line.value("fraction", fraction), fraction);
        fraction = line.value("fraction", fraction);
    }
    EXPECT_GT(fraction, 0.1);
    EXPECT_EQ(lines.back()["event"], "done");
    EXPECT_EQ(lines.back()["tracks"], 2);
    EXPECT_NEAR(fakeBurner().speed, 8 * 176.4, 2);
    EXPECT_TRUE(fakeDisc().samples ==
                makeSectors(310, 1) + std::string(150 * kSectorBytes, '\0') + makeSectors(320, 2));
    const std::string shown = succeed({"disc", "/dev/sr0"});
    for (const char* text : {"Platte", "Ein Lied"}) EXPECT_NE(shown.find(text), std::string::npos) << shown;
    const std::string info = peer({"cd-info", "--no-cddb", "--no-device-info", "/dev/sr0"});
    for (const char* line :
         {"000000 audio", "000460 audio", "000780 leadout", "TITLE: Platte", "TITLE: Ein Lied"})
        EXPECT_NE(info.find(line), std::string::npos) << info;
    EXPECT_NE(fail({"burn", "1.wav", "--drive", "/dev/sr0"}).find("cannot be written to"), std::string::npos);
    EXPECT_EQ(list(), before);
}

TEST_F(DISABLED_Burn, DataAndRewritableDiscs) {
    fakeBurner().isRewritable = true;
    const auto dummy = burn({"1.wav", "--data", "--dummy"});
    EXPECT_EQ(dummy.back()["dummy"], true);
    EXPECT_TRUE(fakeDisc().isBlank);
    burn({"1.wav", "--data", "--title", "Titel"});
    folder.write("disc.iso", fakeDisc().samples);
    peer({"xorriso", "-osirrox", "on", "-indev", "disc.iso", "-extract", "/", "out"});
    EXPECT_EQ(readFile(folder / "out/1.wav"), readFile(folder / "1.wav"));
    const std::string refused = fail({"burn", "1.wav", "--drive", "/dev/sr0"});
    EXPECT_NE(refused.find("sr0: The disc is not empty (--blank erases a rewritable disc)"),
              std::string::npos)
        << refused;
    // A drive that writes something else.
    fakeBurner().damagedAt = 100;
    const std::string damaged = fail({"burn", "1.wav", "--drive", "/dev/sr0", "--blank", "-q"});
    EXPECT_NE(damaged.find("track 1 differs from what was written"), std::string::npos) << damaged;
    EXPECT_TRUE(fakeBurner().wasBlanked);
}

TEST_F(DISABLED_Burn, CtrlCEndsIt) {
    fakeBurner().writeMicroseconds = 30'000;
    const auto before = list();
    CProcess process({kProgram, "burn", "1.wav", "2.wav", "1.wav", "2.wav", "--drive", "/dev/sr0", "--json"},
                     folder.path(), programEnvironment());
    EXPECT_TRUE(waitForWriting(process));
    process.signal(SIGINT);
    const SProcessResult result = process.wait();
    EXPECT_EQ(result.exitCode, 130) << result.out << result.err;
    const auto lines = parseLines(result.out);
    EXPECT_EQ(lines.back()["event"], "cancelled");
    EXPECT_EQ(lines[lines.size() - 2].value("message", ""), "The disc is partly written") << result.out;
    EXPECT_EQ(list(), before);
}

TEST(Burn, AFakedDriveIsWritten) {
    runWithFakeDrive({"Burn.Audio", "Burn.DataAndRewritableDiscs", "Burn.CtrlCEndsIt"});
}

// Many conversions in one process, through the exports and with the real plug-ins.
#include "host/Wav.h"
#include "support/Environment.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>
#include <tonewright/tonewright.h>

#include <atomic>
#include <fstream>
#include <string>
#include <thread>
#include <unistd.h>
#include <vector>

using namespace tests;

namespace {

std::u16string toURI(const std::filesystem::path& path) { // names without special characters only
    const std::string text = "file://" + path.string();
    return {text.begin(), text.end()};
}

long residentKilobytes() {
    long pages = 0, resident = 0;
    std::ifstream("/proc/self/statm") >> pages >> resident;
    return resident * (::sysconf(_SC_PAGESIZE) / 1024);
}

class Conversion : public testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK); }
    void TearDown() override { TONEWRIGHT_DeInitAll(); }

    static int32_t convert(const std::filesystem::path& input, const std::filesystem::path& output,
                           TONEWRIGHT_EncoderCallback callback = nullptr) {
        TONEWRIGHT_Handle source = TONEWRIGHT_CreateAudioSourceFromURI(toURI(input).c_str(), 44100, 2, 2, 1);
        TONEWRIGHT_Handle format =
            TONEWRIGHT_CreateAudioFormatFromURI(toURI(output).c_str(), 44100, 2, 2, 0.0, 0, 0, 0);
        TONEWRIGHT_Handle encoder = TONEWRIGHT_CreateAudioEncoder(source, format);
        TONEWRIGHT_DestroyHandle(source);
        TONEWRIGHT_DestroyHandle(format);
        if (callback) TONEWRIGHT_AudioEncoder_SetCallback(encoder, callback);
        const int32_t result = TONEWRIGHT_AudioEncoder_Encode(encoder);
        TONEWRIGHT_DestroyHandle(encoder);
        return result;
    }

    CEnvironment quiet{"TONEWRIGHT_DEBUG_OUTPUT", "0"}; // failures are expected here
    CTempFolder folder;
};

} // namespace

TEST_F(Conversion, LeavesNothingBehindThousandsOfTimes) {
#ifdef TONEWRIGHT_SANITIZED
    constexpr int kRuns = 200; // slower, and leaks are reported anyway
#else
    constexpr int kRuns = 2000;
    constexpr long kMargin = 2048; // kB; less than 2 kB for each run
#endif
    const SSound sound = makeNoise(44100, 2, 16, 4410);
    folder.write("in.wav", toWav(sound));
    folder.write("bad.flac", "no sound");
    size_t files = 0, threads = 0;
    [[maybe_unused]] long resident = 0;
    for (int i = 0; i < kRuns; ++i) {
        if (i == 100) {
            files = countEntries("/proc/self/fd");
            threads = countEntries("/proc/self/task");
            resident = residentKilobytes();
        }
        switch (i % 4) {
        case 0:
            ASSERT_EQ(convert(folder / "in.wav", folder / "out.flac"), TONEWRIGHT_OK);
            break;
        case 1:
            ASSERT_EQ(convert(folder / "out.flac", folder / "back.wav"), TONEWRIGHT_OK);
            break;
        case 2:
            ASSERT_EQ(convert(folder / "bad.flac", folder / "bad.wav"), TONEWRIGHT_ENCODER_FAILED);
            break;
        case 3:
            ASSERT_EQ(convert(folder / "in.wav", folder / "missing/x.wav"), TONEWRIGHT_ENCODER_RUN_FAILED);
        }
    }
    EXPECT_EQ(countEntries("/proc/self/fd"), files);
    EXPECT_LE(countEntries("/proc/self/task"), threads);
#ifndef TONEWRIGHT_SANITIZED
    EXPECT_LT(residentKilobytes(), resident + kMargin);
#endif
    EXPECT_TRUE(parseWav(readFile(folder / "back.wav")) == sound);
}

TEST_F(Conversion, RunsOnEightThreadsAtOnce) {
    constexpr int kThreads = 8, kRounds = 4;
    static std::atomic<int> calls;
    calls = 0;
    std::vector<SSound> sounds;
    for (int i = 0; i < kThreads; ++i) {
        sounds.push_back(makeNoise(44100, 2, 16, 20000, static_cast<uint32_t>(i)));
        folder.write(std::to_string(i) + ".wav", toWav(sounds.back()));
    }
    std::vector<std::thread> threads;
    std::atomic<int> failures{0};
    for (int i = 0; i < kThreads; ++i)
        threads.emplace_back([&, i] {
            const std::string name = std::to_string(i);
            static constexpr const char* kLossy[] = {".ogg", ".mp3", ".aiff", ".flac"};
            const auto count = [](double, int32_t) {
                ++calls;
                return true;
            };
            for (int round = 0; round < kRounds; ++round) {
                failures += convert(folder / (name + ".wav"), folder / (name + ".flac"), count) != 0;
                failures += convert(folder / (name + ".flac"), folder / (name + ".out.wav"), count) != 0;
                const std::string other = name + ".x" + kLossy[(i + round) % 4];
                failures += convert(folder / (name + ".wav"), folder / other, count) != 0;
                failures += convert(folder / other, folder / (name + ".y.wav"), count) != 0;
            }
        });
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(failures, 0);
    EXPECT_GE(calls, kThreads * kRounds * 4);
    for (int i = 0; i < kThreads; ++i)
        EXPECT_TRUE(parseWav(readFile(folder / (std::to_string(i) + ".out.wav"))) ==
                    sounds[static_cast<size_t>(i)]);
}

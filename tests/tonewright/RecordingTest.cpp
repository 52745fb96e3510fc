#include "Library.h"
#include "peru/Errors.h"
#include "support/Files.h"
#include "support/ScriptedDevice.h"
#include "tonewright/RecordingAudioSource.h"

#include <limits>
#include <numeric>

// The program in docs/examples, with its main under another name.
int recordMain(int argc, char** argv);

namespace {

using namespace tests;
using sonora2::audio::IAudioChunk;

std::string pattern(size_t size, size_t seed = 1) {
    return patternBytes(size + seed).substr(seed);
}

std::atomic<int> g_calls{0};
std::atomic<int> g_callsWanted{0};
std::atomic<double> g_position{0.0};
bool countCalls(double position) {
    g_position = position;
    return ++g_calls < g_callsWanted;
}
bool throwInt(double) {
    throw 42;
}
bool throwError(double) {
    throw peru::CError("host is out of order");
}
double g_levels[2] = {};
void keepLevels(double left, double right) {
    g_levels[0] = left;
    g_levels[1] = right;
}
void throwFromLevels(double, double) {
    throw std::runtime_error("no paint");
}

class Recording : public CLibraryTest {
protected:
    void SetUp() override {
        CLibraryTest::SetUp();
        g_calls = 0;
        g_callsWanted = std::numeric_limits<int>::max();
    }
    P<CScriptedInDevice> device = peru::make<CScriptedInDevice>();
};

TEST_F(Recording, Source_FindsAFormatOfTheDevice) {
    struct SCase {
        int32_t rate, channels, bytes;
        P<CAudioFormat> given; // empty: as requested
        bool isMade, isUnchanged;
    };
    const auto cd = peru::make<CAudioFormat>(44100, 2, 16);
    const auto wide = peru::make<CAudioFormat>(48000, 2, 24);
    for (const SCase& c : std::initializer_list<SCase>{{44100, 2, 2, nullptr, true, true},
                                                       {48000, 2, 3, nullptr, true, true},
                                                       {44100, 1, 2, nullptr, true, false},
                                                       {48000, 2, 2, cd, true, false},
                                                       {48000, 1, 1, wide, true, false},
                                                       {48000, 1, 3, nullptr, true, false},
                                                       {96000, 2, 3, wide, true, false},
                                                       {96000, 2, 5, wide, false, false},
                                                       {44100, 0, 2, nullptr, false, false},
                                                       {0, 2, 2, nullptr, false, false},
                                                       {44100, 2, -1, nullptr, false, false}}) {
        int32_t channelsAsked = 2;
        device->takes = [&](int32_t rate, int32_t bytes, int32_t channels) {
            channelsAsked = channels;
            return c.given ? c.given : peru::make<CAudioFormat>(rate, channels, bytes * 8);
        };
        const CHandle deviceHandle = wrap(device);
        const CHandle handle(
            TONEWRIGHT_CreateAudioSoureFromAudioInDevice(deviceHandle.get(), c.rate, c.channels, c.bytes));
        EXPECT_EQ(handle != nullptr, c.isMade) << c.rate << " " << c.channels << " " << c.bytes;
        EXPECT_EQ(channelsAsked, 2);
        EXPECT_EQ(device->getListenerCount(), c.isMade ? 1u : 0u);
        if (!handle) continue;
        EXPECT_EQ(TONEWRIGHT_AudioSource_GetDuration(handle.get()), 1.7976931348623157e+308);
        auto source = peru::make<CRecordingAudioSource>(device, c.rate, c.channels, c.bytes);
        for (int round = 0; round < 2; ++round) { // a second recording restarts at 0
            source->open();
            const int64_t frames = 4000;
            const std::string sent = pattern(frames * device->format->getBytesPerFrame());
            EXPECT_TRUE(device->deliver(sent));
            const auto first = source->getNextAudioChunk();
            EXPECT_EQ(first->getTimestamp(), 0.0);
            EXPECT_TRUE(device->deliver(sent));
            const auto second = source->getNextAudioChunk();
            if (c.isUnchanged) {
                EXPECT_TRUE(bytesOf(first) == sent && bytesOf(second) == sent);
                EXPECT_EQ(second->getTimestamp(), 4000.0 / c.rate);
            } else {
                EXPECT_EQ(second->getTimestamp(), first->getSize() / (c.channels * c.bytes * 1.0 * c.rate));
                EXPECT_NEAR((first->getSize() + second->getSize()) / (c.channels * c.bytes),
                            2.0 * frames * c.rate / device->format->getSampleRate(), 40.0);
            }
            EXPECT_TRUE(device->deliver(sent));
            EXPECT_EQ(source->getNextAudioChunk()->getTimestamp(),
                      (first->getSize() + second->getSize()) / (c.channels * c.bytes * 1.0 * c.rate));
            EXPECT_TRUE(device->deliver(sent)) << "left in the queue, and gone with the next opening";
            source->close();
        }
    }
    device->takes = [](int32_t, int32_t, int32_t) -> P<CAudioFormat> { return nullptr; };
    EXPECT_FALSE(CHandle(TONEWRIGHT_CreateAudioSoureFromAudioInDevice(wrap(device).get(), 44100, 2, 2)));
    device->takes = [](int32_t, int32_t, int32_t) -> P<CAudioFormat> { throw peru::CError("unplugged"); };
    EXPECT_FALSE(CHandle(TONEWRIGHT_CreateAudioSoureFromAudioInDevice(wrap(device).get(), 44100, 2, 2)));
    EXPECT_EQ(device->getListenerCount(), 0u) << "what was not made does not listen";
}

TEST_F(Recording, Chunks_AreWhatIsThereButNoMoreThanASecond) {
    auto source = peru::make<CRecordingAudioSource>(device, 8000, 2, 2);
    EXPECT_TRUE(source->isEOF());
    EXPECT_FALSE(source->getNextAudioChunk()) << "a closed source has nothing to wait for";
    source->open();
    EXPECT_FALSE(source->isEOF());
    const std::string sent = pattern(8000 * 4 * 2 + 400);
    for (size_t at = 0; at < sent.size(); at += 3200) EXPECT_TRUE(device->deliver(sent.substr(at, 3200)));
    device->endStream();
    std::string received;
    for (const size_t size : {32000u, 32000u, 400u}) {
        EXPECT_FALSE(source->isEOF());
        const auto chunk = source->getNextAudioChunk();
        EXPECT_EQ(chunk->getTimestamp(), received.size() / 32000.0);
        EXPECT_EQ(chunk->getSize(), size);
        received += bytesOf(chunk);
    }
    EXPECT_TRUE(received == sent);
    EXPECT_TRUE(source->isEOF());
    const auto start = std::chrono::steady_clock::now();
    EXPECT_FALSE(source->getNextAudioChunk());
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(2));
}

TEST_F(Recording, SilentDevice_EndsTheReaderUntilItDeliversAgain) {
    auto source = peru::make<CRecordingAudioSource>(device, 8000, 2, 2, 50);
    source->open();
    EXPECT_FALSE(source->getNextAudioChunk());
    EXPECT_TRUE(source->isEOF());
    EXPECT_TRUE(device->deliver("abcd"));
    EXPECT_EQ(bytesOf(source->getNextAudioChunk()), "abcd");
    EXPECT_FALSE(source->isEOF());
}

TEST_F(Recording, Callbacks_HearOfEveryBlockAndMayEndIt) {
    struct SCase {
        TONEWRIGHT_RecordingCallback callback;
        TONEWRIGHT_RecordingVolumeCallback volume;
        int wanted;    // calls until the callback returns false
        int delivered; // blocks that reach the source, of 10
        int wantedByFunction = 99;
    };
    for (const SCase& c : std::initializer_list<SCase>{{nullptr, nullptr, 99, 10},
                                                       {countCalls, keepLevels, 99, 10},
                                                       {countCalls, nullptr, 3, 3},
                                                       {countCalls, keepLevels, 99, 4, 4},
                                                       {nullptr, nullptr, 99, 4, 4},
                                                       {countCalls, nullptr, 1, 1},
                                                       {throwInt, nullptr, 99, 1},
                                                       {throwError, keepLevels, 99, 1},
                                                       {nullptr, throwFromLevels, 99, 2}}) {
        const CHandle deviceHandle = wrap(device);
        const CHandle source(TONEWRIGHT_CreateAudioSoureFromAudioInDevice(deviceHandle.get(), 8000, 2, 2));
        TONEWRIGHT_AudioSource_SetRecordingCallback(source.get(), c.callback);
        TONEWRIGHT_AudioSource_SetRecordingVolumeCallback(source.get(), c.volume);
        int functionCalls = 0;
        double left = -1.0;
        const auto target = behind<tonewright::IRecordingTarget>(source);
        target->setProgressFunction([&](double) { return ++functionCalls < c.wantedByFunction; });
        target->setLevelFunction([&](double level, double) { left = level; });
        g_calls = 0;
        g_callsWanted = c.wanted;
        EXPECT_EQ(TONEWRIGHT_AudioSource_Open(source.get()), 0);
        int delivered = 0;
        while (delivered < 10 && device->getStatus() == 1) {
            device->deliver(pattern(800), 0.1 * delivered, 0.5);
            ++delivered;
        }
        EXPECT_EQ(delivered, c.delivered);
        if (!c.callback || c.callback == countCalls) {
            EXPECT_EQ(functionCalls, c.delivered);
            EXPECT_EQ(left, c.volume == throwFromLevels ? -1.0 : 0.1 * (delivered - 1));
        }
        if (c.callback == countCalls) {
            EXPECT_EQ(g_calls, c.delivered);
            EXPECT_EQ(g_position, 200.0 * c.delivered / 8000);
        }
        if (delivered == 10 && c.volume) {
            EXPECT_EQ(g_levels[0], 0.1 * 9);
            EXPECT_EQ(g_levels[1], 0.5);
        }
        EXPECT_EQ(TONEWRIGHT_AudioSource_Close(source.get()), 0);
    }
    // A handle of another kind is ignored.
    const CHandle other = wrap(peru::make<CFakeSource>(SFakeSource{}));
    log->take();
    TONEWRIGHT_AudioSource_SetRecordingCallback(other.get(), countCalls);
    TONEWRIGHT_AudioSource_SetRecordingVolumeCallback(other.get(), keepLevels);
    EXPECT_FALSE(TONEWRIGHT_CreateAudioSoureFromAudioInDevice(other.get(), 8000, 2, 2));
    EXPECT_TRUE(log->take().empty());
}

TEST_F(Recording, Encoder_GetsEveryBlockUntilTheCallbackEndsIt) {
    for (int round = 0; round < 20; ++round) {
        const int wanted = 1 + round * 7;
        unsigned block = 0;
        device->next = [&block] { return pattern(512, ++block); };
        CHandle deviceHandle = wrap(device);
        const CHandle source(TONEWRIGHT_CreateAudioSoureFromAudioInDevice(deviceHandle.get(), 8000, 2, 2));
        deviceHandle.reset();
        TONEWRIGHT_AudioSource_SetRecordingCallback(source.get(), countCalls);
        g_calls = 0;
        g_callsWanted = wanted;
        const auto format = peru::make<CFakeFormat>(CFakeFormat::takes(8000, 2, 2));
        const CHandle formatHandle = wrap(format);
        const CHandle encoder(TONEWRIGHT_CreateAudioEncoder(source.get(), formatHandle.get()));
        g_calls = 0; // creating the encoder opened the source briefly
        EXPECT_EQ(TONEWRIGHT_AudioEncoder_Encode(encoder.get()), 0);
        EXPECT_EQ(g_calls, wanted);
        EXPECT_EQ(format->bytes, 512 * wanted) << "the last block is there too";
        EXPECT_FALSE(device->isOpened());
    }
}

TEST_F(Recording, Source_MayBeClosedAndDestroyedWhileItRecords) {
    device->next = [] { return pattern(512); };
    for (int round = 0; round < 20; ++round) {
        CHandle source(TONEWRIGHT_CreateAudioSoureFromAudioInDevice(wrap(device).get(), 8000, 1, 2));
        TONEWRIGHT_AudioSource_SetRecordingCallback(source.get(), countCalls);
        g_calls = 0;
        if (round % 2) {
            EXPECT_EQ(TONEWRIGHT_AudioSource_Open(source.get()), 0);
            while (g_calls < 3) std::this_thread::yield();
            source.reset();
        } else {
            std::atomic<bool> isWriting{false};
            const CHandle format = wrap(
                peru::make<CFakeFormat>(CFakeFormat::takes(8000, 1, 2), [&isWriting] { isWriting = true; }));
            const CHandle encoder(TONEWRIGHT_CreateAudioEncoder(source.get(), format.get()));
            std::thread job([&] { EXPECT_EQ(TONEWRIGHT_AudioEncoder_Encode(encoder.get()), 0); });
            while (!isWriting) std::this_thread::yield();
            EXPECT_EQ(TONEWRIGHT_AudioSource_Close(source.get()), 0);
            job.join();
        }
        EXPECT_EQ(device->getStatus(), 0);
    }
    EXPECT_EQ(device->getListenerCount(), 0u);
    EXPECT_EQ(device->overlaps, 0);
}

TEST(RecordingExample, Record_WritesWhatTheDeviceDelivers) {
    CTempFolder folder;
    P<CScriptedInDevice> device;
    const auto record = [&device](std::vector<std::string> arguments) {
        CScriptedSystem system(nullptr, device); // the end of the library drops it
        arguments.insert(arguments.begin(), "record");
        std::vector<char*> pointers;
        for (std::string& argument : arguments) pointers.push_back(argument.data());
        return recordMain(static_cast<int>(pointers.size()), pointers.data());
    };
    EXPECT_EQ(record({}), 2);
    EXPECT_EQ(record({"a.wav", "soon"}), 2);
    const std::string file = (folder / "voice.wav").string();
    EXPECT_EQ(record({file, "0.1"}), 1) << "no device";
    device = peru::make<CScriptedInDevice>();
    unsigned block = 0;
    device->next = [&block] { return pattern(441 * 4, ++block); };
    EXPECT_EQ(record({(folder / "voice.unknown").string(), "0.1"}), 1);
    block = 0;
    EXPECT_EQ(record({file, "0.1"}), 0);
    std::string expected;
    for (unsigned i = block - 9; i <= block; ++i) expected += pattern(441 * 4, i);
    const std::string written = readFile(file);
    EXPECT_TRUE(written.starts_with("RIFF") && written.ends_with(expected));
    EXPECT_LT(written.size(), expected.size() + 100) << "ten blocks of 10 ms and a header";
}

} // namespace

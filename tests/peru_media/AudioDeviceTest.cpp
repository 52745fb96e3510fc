// The states of devices and real sound, tested with a private sound server.
#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/media/Errors.h"
#include "peru/media/ISystem.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/uri/IURI.h"
#include "support/Files.h"
#include "support/SoundServer.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <functional>
#include <limits>
#include <mutex>
#include <random>
#include <thread>

using namespace peru;
using namespace peru::media;
using tests::countEntries;
using tests::CSoundServer;
using tests::errorOf;
using tests::text;
using tests::withoutSilence;

namespace {

using Clock = std::chrono::steady_clock;
constexpr size_t kFrameBytes = CSoundServer::kFrameBytes;

// The most takes of a test that a busy sound server may spoil.
constexpr int kTakes = 4;

template <class Condition> bool waitFor(Condition condition, int seconds = 60) {
    const auto end = Clock::now() + std::chrono::seconds(seconds);
    while (!condition() && Clock::now() < end) std::this_thread::sleep_for(std::chrono::milliseconds(1));
    return condition();
}

class AudioDevice : public testing::Test {
protected:
    explicit AudioDevice(tests::EMicrophone microphone = tests::EMicrophone::none) : server(microphone) {}
    ~AudioDevice() override {
        out = nullptr;
        in = nullptr;
        CGlobalObjFactory::shutdown();
    }

    static P<CAudioFormat> makeFormat(int32_t bits = 16, int32_t channels = 2) {
        return make<CAudioFormat>(CSoundServer::kRate, channels, bits);
    }
    static std::string makeNoise(double seconds) {
        std::string noise(static_cast<size_t>(seconds * CSoundServer::kRate) * kFrameBytes, '\0');
        std::mt19937 random(7);
        for (char& byte : noise) byte = static_cast<char>(random() | 1); // never silent
        return noise;
    }
    void write(const std::string& sound) { out->write(sound.data(), static_cast<int64_t>(sound.size())); }
    std::string playLateWithAPause(const std::string& noise);

    CSoundServer server;
    P<IAudioOutDevice> out = getSystem()->getDefaultOutDevice();
    P<IAudioInDevice> in = getSystem()->getDefaultInDevice();
};

class Microphone : public AudioDevice {
protected:
    Microphone() : AudioDevice(tests::EMicrophone::isolated) {}
};

// Records what it receives, up to a number of blocks.
class CEars : public CObject, public IAudioInDeviceListener {
public:
    explicit CEars(int limit = std::numeric_limits<int>::max()) : m_limit(limit) {}
    bool onAudioData(const void* data, int64_t size) override {
        if (onBlock) onBlock();
        std::lock_guard lock(m_mutex);
        m_heard.append(static_cast<const char*>(data), static_cast<size_t>(size));
        return ++blocks < m_limit;
    }
    void onVolume(const P<CVolumeInfo>& volume) override {
        ++volumes;
        if (volume->getLeft() <= loudest) return;
        loudest = volume->getLeft();
        loudestRight = volume->getRight();
    }
    std::string getHeard() const {
        std::lock_guard lock(m_mutex);
        return m_heard;
    }

    std::function<void()> onBlock;
    std::atomic<int> blocks{0}, volumes{0};
    std::atomic<double> loudest{0}, loudestRight{0};

private:
    const int m_limit;
    mutable std::mutex m_mutex;
    std::string m_heard;
};

} // namespace

TEST_F(AudioDevice, IsListedAndFindsFormats) {
    const WEnum<IAudioOutDevice> outs = getSystem()->getOutDevices();
    EXPECT_EQ(outs.getCount(), 1);
    EXPECT_EQ(getSystem()->getInDevices().getCount(), 1);
    EXPECT_TRUE(out->getListName()->equals("ID: 0 - default (UNKNOWN) [DEFAULT]"));
    EXPECT_TRUE(out->getHostApiDisplayName()->equals("ALSA"));
    EXPECT_TRUE(out->getId()->equals("0"));
    const struct {
        int32_t rate, bytes, channels;
        const char* found;
    } cases[] = {{44100, 2, 2, "Sample Rate: 44100 Channel: 2 Bits: 16"},
                 {48000, 3, 1, "Sample Rate: 48000 Channel: 1 Bits: 24"},
                 {44100, 4, 2, "Sample Rate: 44100 Channel: 2 Bits: 32"},
                 {100, 1, 2, "Sample Rate: 8000 Channel: 2 Bits: 8"}};
    for (const auto& each : cases)
        for (const P<IAudioDevice>& device : {P<IAudioDevice>(out), P<IAudioDevice>(in)})
            EXPECT_EQ(text(device->getFormat(each.rate, each.bytes, each.channels)->getDescription()),
                      each.found);
}

TEST_F(AudioDevice, ComesAndGoesWithoutARestart) {
    const std::string path = std::getenv("ALSA_CONFIG_PATH"), before = tests::readFile(path);
    const std::string other =
        "pcm.aaa { type pulse server \"" + std::string(std::getenv("PULSE_SERVER")) + "\" }\n";
    const auto count = [] { return getSystem()->getOutDevices().getCount(); };
    out->open(makeFormat());
    std::ofstream(path) << other << before;
    // Longer than an enumeration counts as current.
    std::this_thread::sleep_for(std::chrono::milliseconds(150));
    EXPECT_EQ(count(), 1) << "the sound system cannot be restarted while a device is open";
    out->close();
    P<IAudioOutDevice> added;
    for (WEnum<IAudioOutDevice> devices = getSystem()->getOutDevices(); devices.hasMore();)
        if (const P<IAudioOutDevice> device = devices.getNext(); device->getName()->equals("aaa"))
            added = device;
    ASSERT_TRUE(added);
    EXPECT_TRUE(getSystem()->getDefaultOutDevice()->getId()->equals("1"));
    std::ofstream(path) << before;
    EXPECT_TRUE(waitFor([&] { return count() == 1; }));
    EXPECT_EQ(errorOf([&] { added->open(makeFormat()); }),
              "The sound device 'aaa' is not available any more");
    EXPECT_FALSE(added->isOpened());
    EXPECT_NO_THROW(out->open(makeFormat()));
}

TEST_F(AudioDevice, RefusesWhatItsStateForbids) {
    char frame[4] = {};
    EXPECT_THROW(out->start(), CMediaException);
    EXPECT_THROW(in->start(), CMediaException);
    EXPECT_THROW(out->write(frame, 4), CMediaException);
    EXPECT_THROW(out->open(nullptr), CMediaException);
    EXPECT_THROW(in->open(), CMediaException);
    EXPECT_THROW(out->setGain(std::numeric_limits<double>::quiet_NaN()), CMediaException);
    EXPECT_EQ(out->getPosition(), 0.0);
    for (int32_t bits : {32, 0, 12}) {
        const std::string expected = std::to_string(bits) + " Bits are not supported";
        EXPECT_EQ(errorOf([&] { out->open(makeFormat(bits)); }), expected);
        EXPECT_EQ(errorOf([&] { in->open(makeFormat(bits)); }), expected);
    }
    EXPECT_EQ(errorOf([&] { out->open(makeFormat(16, 1000)); }), "Invalid number of channels");
    EXPECT_EQ(errorOf([&] { in->open(make<CAudioFormat>(5, 2, 16)); }), "Invalid sample rate");
    EXPECT_FALSE(out->isOpened() || in->isOpened());

    // The device still works, and can be opened again after close.
    in->setFormat(makeFormat());
    for (int i = 0; i < 2; ++i) {
        out->open(makeFormat());
        out->open(makeFormat(32)); // does nothing
        in->open();
        EXPECT_TRUE(out->isOpened() && in->isOpened());
        out->start();
        in->start();
        EXPECT_EQ(out->getStatus() + in->getStatus(), 2 * kDeviceRunning);
        out->close();
        in->stop();
        EXPECT_FALSE(out->isOpened() || in->isOpened());
        EXPECT_EQ(out->getStatus() + in->getStatus(), 2 * kDeviceIdle);
    }
}

TEST_F(AudioDevice, IsStoppedAtOnceWhileItWaitsForData) {
    for (bool closes : {false, true}) {
        Clock::duration fastest = Clock::duration::max();
        for (int i = 0; i < 4; ++i) {
            out->open(makeFormat());
            out->start();
            std::this_thread::sleep_for(std::chrono::milliseconds(20)); // until the callback waits
            const auto start = Clock::now();
            closes ? out->close() : out->stop();
            fastest = std::min(fastest, Clock::now() - start);
        }
        // The wait would otherwise last for nearly half a second.
        EXPECT_LT(fastest, std::chrono::milliseconds(250)) << closes;
    }
}

// Returns what was heard.
std::string AudioDevice::playLateWithAPause(const std::string& noise) {
    const auto end = static_cast<double>(noise.size()) / kFrameBytes / CSoundServer::kRate;
    const auto ears = server.listen();
    out->open(makeFormat());
    out->start();
    // Until one wait of the callback has timed out.
    EXPECT_TRUE(waitFor([&] { return ears->readOut().size() > kFrameBytes * CSoundServer::kRate * 7 / 10; }));
    EXPECT_EQ(out->getPosition(), 0.0);
    write(noise);
    EXPECT_TRUE(waitFor([&] { return out->getPosition() > 0.3; }));
    out->pause();
    EXPECT_EQ(out->getStatus(), kDeviceIdle);
    const int64_t queued = out->getQueuedSize();
    EXPECT_GT(queued, 0);
    // The position advances to the end of what the system has buffered, and no further.
    double still = -1;
    EXPECT_TRUE(waitFor([&] {
        const double before = std::exchange(still, out->getPosition());
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
        return before == still;
    }));
    EXPECT_LE(still,
              static_cast<double>(noise.size() - static_cast<size_t>(queued)) / kFrameBytes / 44100 + 1e-6);
    out->start();
    EXPECT_TRUE(waitFor([&] { return out->getPosition() >= end - 1e-6; }));
    EXPECT_NEAR(out->getPosition(), end, 1e-6);
    // The server loses samples if it gets no processor in time.
    waitFor([&] { return withoutSilence(ears->readOut()).size() >= noise.size(); }, 5);
    out->close();
    return withoutSilence(ears->readOut());
}

TEST_F(AudioDevice, PlaysEverySampleOfWhatComesLateAcrossAPause) {
    const std::string noise = makeNoise(1.2);
    std::string heard;
    for (int take = 0; take < kTakes && heard != noise; ++take) heard = playLateWithAPause(noise);
    EXPECT_TRUE(heard == noise);
}

TEST_F(AudioDevice, DropsTheQueueWhenStopped) {
    const std::string noise = makeNoise(10);
    out->open(makeFormat());
    write(noise);
    out->start();
    ASSERT_TRUE(waitFor([&] { return out->getPosition() > 0.1; }));
    out->stop();
    EXPECT_EQ(out->getQueuedSize(), 0);
    EXPECT_TRUE(out->isOpened());
    const double stopped = out->getPosition();
    EXPECT_GE(stopped, 0.1);
    EXPECT_LT(stopped, 5.0);
    // Plays new sound afterwards.
    out->write(noise.data(), 4 * 4410);
    out->start();
    ASSERT_TRUE(waitFor([&] { return out->getPosition() >= stopped + 0.1 - 1e-6; }));
    EXPECT_NEAR(out->getPosition(), stopped + 0.1, 1e-6);
}

TEST_F(AudioDevice, PlaysEveryWidthWithGain) {
    struct SCase {
        int32_t bits;
        double gain;
        std::string frame;    // of two channels
        std::string expected; // in 16 bits
    };
    const SCase cases[] = {
        {8, 1.0, "\x90\x70", std::string("\0\x10\0\xF0", 4)},
        {8, 2.0, "\x90\x01", std::string("\0\x20\0\x80", 4)},
        {16, 0.5, std::string("\0\x40\x02\x80", 4), std::string("\0\x20\x01\xC0", 4)},
        {24, 1.0, std::string("\0\x34\x12\0\xFE\xFF", 6), std::string("\x34\x12\xFE\xFF", 4)},
        {24, 3.0, std::string("\0\0\x10\0\0\xF0", 6), std::string("\0\x30\0\xD0", 4)},
    };
    for (const SCase& each : cases) {
        SCOPED_TRACE(std::to_string(each.bits) + " bits times " + std::to_string(each.gain));
        std::string sound;
        for (int i = 0; i < 4410; ++i) sound += each.frame;
        // A busy machine loses some frames. Those that arrive must be correct.
        const auto isHeard = [&each](const std::string& heard) {
            for (size_t i = 0; i < heard.size(); i += 4)
                if (heard.compare(i, 4, each.expected) != 0) {
                    ADD_FAILURE() << "wrong frame at " << i;
                    return true;
                }
            return heard.size() >= 4 * 500;
        };
        const auto ears = server.listen();
        // Once from the queue and once from a stream.
        out->setGain(each.gain);
        out->open(makeFormat(each.bits));
        write(sound);
        out->start();
        EXPECT_TRUE(waitFor([&] { return isHeard(withoutSilence(ears->readOut())); }));
        out->close();

        const size_t heard = ears->readOut().size() / 4 * 4;
        const P<CMemoryIOStream> source = make<CMemoryIOStream>();
        source->write(sound.data(), static_cast<int64_t>(sound.size()));
        source->seek(0);
        out->open(makeFormat(each.bits), source);
        EXPECT_THROW(out->write(sound.data(), 4), CMediaException);
        out->start();
        EXPECT_TRUE(waitFor([&] { return isHeard(withoutSilence(ears->readOut(), heard)); }));
        EXPECT_TRUE(waitFor([&] { return out->getPosition() >= 0.1 - 1e-6; }));
        EXPECT_EQ(out->getStatus(), kDeviceRunning); // it never stops by itself
        out->close();
    }
}

TEST_F(AudioDevice, TellsListenersInTurnUntilOneHasEnough) {
    const P<CEars> first = make<CEars>(), second = make<CEars>(3), third = make<CEars>();
    const P<CEars> gone = make<CEars>();
    for (const P<CEars>& note : {first, gone, second, third}) in->addListener(note.get());
    in->removeListener(gone.get());
    in->open(makeFormat());
    in->start();
    EXPECT_TRUE(waitFor([&] { return in->getStatus() == kDeviceIdle; }));
    EXPECT_EQ(first->blocks, 3);
    EXPECT_EQ(second->blocks, 3);
    EXPECT_EQ(third->blocks, 2);
    EXPECT_EQ(third->volumes, 2);
    EXPECT_EQ(gone->blocks + gone->volumes, 0);
    in->close();

    // An exception from a listener ends the recording as well.
    first->onBlock = [] { throw CError("no more"); };
    in->open(makeFormat());
    in->start();
    EXPECT_TRUE(waitFor([&] { return in->getStatus() == kDeviceIdle; }));
    EXPECT_EQ(first->blocks, 3);
    for (const P<CEars>& note : {second, third}) in->removeListener(note.get());

    // It can be started again.
    first->onBlock = nullptr;
    in->start();
    EXPECT_TRUE(waitFor([&] { return first->blocks > 3; }));
    in->close();
    in->removeListener(first.get());
}

TEST_F(AudioDevice, LetsListenersAskAndLeaveWhileItRecords) {
    const P<CEars> keen = make<CEars>(), passing = make<CEars>();
    keen->onBlock = [&] { static_cast<void>(in->getPosition() + in->getStatus()); };
    bool present = true;
    passing->onBlock = [&] { EXPECT_TRUE(present); };
    in->addListener(keen.get());
    in->open(makeFormat(16, 3));
    in->start();
    for (int i = 1; i <= 20; ++i) {
        present = true;
        in->addListener(passing.get());
        ASSERT_TRUE(waitFor([&] { return passing->blocks >= i; }));
        in->removeListener(passing.get());
        present = false;
        EXPECT_EQ(in->getStatus(), kDeviceRunning);
    }
    in->stop();
    EXPECT_GT(in->getPosition(), 0.0);
    EXPECT_EQ(keen->volumes, 0); // no levels for three channels
    in->removeListener(keen.get());
}

TEST_F(AudioDevice, LeavesNothingBehind) {
    const std::string sound(44100, '\x11');
    const auto use = [&] {
        const P<IAudioOutDevice> device = getSystem()->getDefaultOutDevice();
        device->open(makeFormat());
        device->write(sound.data(), static_cast<int64_t>(sound.size()));
        device->start();
        const P<IAudioInDevice> microphone = getSystem()->getDefaultInDevice();
        microphone->open(makeFormat());
        microphone->start();
    };
    use();
    const size_t files = countEntries("/proc/self/fd");
    const size_t threads = countEntries("/proc/self/task");
    for (int i = 0; i < 15; ++i) use();
    // The kernel still lists a thread for a moment after it has been joined.
    EXPECT_TRUE(waitFor([&] {
        return countEntries("/proc/self/task") <= threads && countEntries("/proc/self/fd") <= files;
    }));
}

TEST_F(Microphone, RecordsEverySample) {
    const std::string noise = makeNoise(1);
    const P<CEars> ears = make<CEars>();
    in->addListener(ears.get());
    in->open(makeFormat());
    in->start();
    ASSERT_TRUE(waitFor([&] { return ears->blocks > 0; }));
    const auto isHeard = [&] { return ears->getHeard().find(noise) != std::string::npos; };
    for (int take = 0; take < kTakes && !isHeard(); ++take) {
        EXPECT_EQ(server.play(noise)->wait().exitCode, 0);
        waitFor(isHeard, 3); // the server drops sound if it gets no processor in time
    }
    EXPECT_TRUE(isHeard());
    EXPECT_GT(in->getPosition(), 0.9);
    in->close();
    in->removeListener(ears.get());
}

TEST_F(Microphone, RecordsEightBitsWithGainAndLevels) {
    const P<CEars> ears = make<CEars>();
    in->addListener(ears.get());
    in->setGain(2.0);
    in->open(makeFormat(8));
    in->start();
    std::string sound;
    for (int i = 0; i < CSoundServer::kRate; ++i)
        sound += std::string("\0\x10\0\xD0", 4); // 16 and -48 of 128
    const auto player = server.play(sound);
    const std::string expected{"\xA0\x20\xA0\x20\xA0\x20"}; // unsigned, twice as loud
    EXPECT_TRUE(waitFor(
        [&] { return ears->getHeard().find(expected) != std::string::npos && ears->loudestRight > 0; }));
    EXPECT_NEAR(ears->loudest, 32 / 127.0, 1e-9);
    EXPECT_NEAR(ears->loudestRight, 96 / 127.0, 1e-9);
    in->close();
    in->removeListener(ears.get());
}

TEST_F(AudioDevice, TellsThatItHasGone) {
    const P<IAudioOutDevice> paused = getSystem()->getDefaultOutDevice();
    const P<IAudioOutDevice> unopened = getSystem()->getDefaultOutDevice();
    const P<CEars> ears = make<CEars>();
    in->addListener(ears.get());
    in->open(makeFormat());
    in->start();
    out->open(makeFormat());
    write(makeNoise(10));
    out->start();
    paused->open(makeFormat());
    paused->start();
    paused->pause();
    ASSERT_TRUE(waitFor([&] { return out->getPosition() > 0.1 && ears->blocks > 0; }));
    server.kill();
    EXPECT_TRUE(waitFor([&] { return out->getStatus() == kDeviceIdle && in->getStatus() == kDeviceIdle; }));
    EXPECT_THROW(out->getPosition(), CMediaException);
    EXPECT_TRUE(waitFor([&] {
        try {
            paused->getPosition();
            return false;
        } catch (const CMediaException&) {
            return true;
        }
    }));
    EXPECT_NO_THROW(paused->stop());
    EXPECT_THROW(write("1234"), CMediaException);
    out->close();
    in->close();
    in->removeListener(ears.get());
    EXPECT_THROW(unopened->open(makeFormat()), CMediaException);
    EXPECT_THROW(in->open(makeFormat()), CMediaException);
    EXPECT_FALSE(out->isOpened() || in->isOpened() || unopened->isOpened());
}

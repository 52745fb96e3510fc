// The states of devices, tested with a private sound server.
#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/media/Errors.h"
#include "peru/media/ISystem.h"
#include "peru/streams/MemoryIOStream.h"
#include "peru/uri/IURI.h"
#include "support/SoundServer.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <functional>
#include <iterator>
#include <limits>
#include <string>
#include <thread>

using namespace peru;
using namespace peru::media;
using tests::CSoundServer;

namespace {

using Clock = std::chrono::steady_clock;

class AudioDevice : public testing::Test {
protected:
    ~AudioDevice() override {
        out = nullptr;
        in = nullptr;
        CGlobalObjFactory::shutdown();
    }

    static P<CAudioFormat> makeFormat(int32_t bits = 16, int32_t channels = 2) {
        return make<CAudioFormat>(CSoundServer::kRate, channels, bits);
    }
    template <class Condition> static bool waitFor(Condition condition) {
        const auto end = Clock::now() + std::chrono::seconds(60);
        while (!condition() && Clock::now() < end) std::this_thread::sleep_for(std::chrono::milliseconds(1));
        return condition();
    }

    // What was played from an offset on, without silence: a busy machine may leave gaps.
    static std::string getSound(const tests::CProcess& ears, size_t from = 0) {
        static const std::string kSilence(4, '\0');
        const std::string all = ears.readOut();
        std::string sound;
        for (size_t i = from; i + 4 <= all.size(); i += 4)
            if (all.compare(i, 4, kSilence) != 0) sound.append(all, i, 4);
        return sound;
    }

    CSoundServer server;
    P<IAudioOutDevice> out = getSystem()->getDefaultOutDevice();
    P<IAudioInDevice> in = getSystem()->getDefaultInDevice();
};

// Counts calls. The limit is the number of blocks that it accepts.
class CNote : public CObject, public IAudioInDeviceListener {
public:
    explicit CNote(int limit = std::numeric_limits<int>::max()) : m_limit(limit) {}
    bool onAudioData(const void*, int64_t) override {
        if (onBlock) onBlock();
        return ++blocks < m_limit;
    }
    void onVolume(const P<CVolumeInfo>&) override { ++volumes; }
    std::function<void()> onBlock;
    std::atomic<int> blocks{0};
    std::atomic<int> volumes{0};

private:
    const int m_limit;
};

size_t count(const char* folder) {
    const std::filesystem::directory_iterator entries(folder);
    return static_cast<size_t>(std::distance(begin(entries), end(entries)));
}

std::string getMessage(const std::function<void()>& call) {
    try {
        call();
    } catch (const CMediaException& e) {
        return e.what();
    }
    return "";
}

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
        int32_t foundRate, foundBits, foundChannels;
    } cases[] = {{44100, 2, 2, 44100, 16, 2},
                 {48000, 3, 1, 48000, 24, 1},
                 {44100, 1, 1, 44100, 8, 1},
                 {44100, 4, 2, 44100, 32, 2},
                 {100, 2, 2, 8000, 16, 2}};
    for (const auto& each : cases)
        for (const P<IAudioDevice>& device : {P<IAudioDevice>(out), P<IAudioDevice>(in)}) {
            const P<CAudioFormat> found = device->getFormat(each.rate, each.bytes, each.channels);
            ASSERT_TRUE(found);
            EXPECT_EQ(found->getSampleRate(), each.foundRate);
            EXPECT_EQ(found->getBitsPerSample(), each.foundBits);
            EXPECT_EQ(found->getChannelCount(), each.foundChannels);
        }
}

TEST_F(AudioDevice, ComesAndGoesWithoutARestart) {
    const std::string path = std::getenv("ALSA_CONFIG_PATH"), before = tests::readFile(path);
    const std::string other =
        "pcm.aaa { type pulse server \"" + std::string(std::getenv("PULSE_SERVER")) + "\" }\n";
    const auto count = [] { return getSystem()->getOutDevices().getCount(); };
    out->open(makeFormat());
    std::ofstream(path) << other << before;
    std::this_thread::sleep_for(
        std::chrono::milliseconds(150)); // longer than an enumeration counts as current
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
    EXPECT_EQ(getMessage([&] { added->open(makeFormat()); }),
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
        EXPECT_EQ(getMessage([&] { out->open(makeFormat(bits)); }), expected);
        EXPECT_EQ(getMessage([&] { in->open(makeFormat(bits)); }), expected);
    }
    EXPECT_EQ(getMessage([&] { out->open(makeFormat(16, 1000)); }), "Invalid number of channels");
    EXPECT_EQ(getMessage([&] { in->open(make<CAudioFormat>(5, 2, 16)); }), "Invalid sample rate");
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

TEST_F(AudioDevice, PlaysAllOfWhatComesLate) {
    std::string sound;
    for (int i = 0; i < 22050; ++i) sound += {char(i | 1), char(i >> 8), char(i | 1), char(i >> 8)};
    out->open(makeFormat());
    out->start();
    const auto ears = server.listen();
    // Until one wait of the callback has timed out.
    ASSERT_TRUE(waitFor([&] { return ears->readOut().size() > size_t{4} * CSoundServer::kRate * 7 / 10; }));
    EXPECT_EQ(out->getPosition(), 0.0);
    out->write(sound.data(), static_cast<int64_t>(sound.size()));
    EXPECT_TRUE(waitFor([&] { return getSound(*ears).size() >= sound.size(); }));
    EXPECT_TRUE(getSound(*ears) == sound);
    EXPECT_TRUE(waitFor([&] { return out->getPosition() >= 0.5 - 1e-6; }));
}

TEST_F(AudioDevice, DropsTheQueueWhenStopped) {
    const std::string noise(10 * CSoundServer::kRate * 4, '\x11');
    out->open(makeFormat());
    out->write(noise.data(), static_cast<int64_t>(noise.size()));
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
        out->write(sound.data(), static_cast<int64_t>(sound.size()));
        out->start();
        EXPECT_TRUE(waitFor([&] { return isHeard(getSound(*ears)); }));
        out->close();

        const size_t heard = ears->readOut().size() / 4 * 4;
        const P<CMemoryIOStream> source = make<CMemoryIOStream>();
        source->write(sound.data(), static_cast<int64_t>(sound.size()));
        source->seek(0);
        out->open(makeFormat(each.bits), source);
        EXPECT_THROW(out->write(sound.data(), 4), CMediaException);
        out->start();
        EXPECT_TRUE(waitFor([&] { return isHeard(getSound(*ears, heard)); }));
        EXPECT_TRUE(waitFor([&] { return out->getPosition() >= 0.1 - 1e-6; }));
        EXPECT_EQ(out->getStatus(), kDeviceRunning); // it never stops by itself
        out->close();
    }
}

TEST_F(AudioDevice, TellsListenersInTurnUntilOneHasEnough) {
    const P<CNote> first = make<CNote>(), second = make<CNote>(3), third = make<CNote>();
    const P<CNote> gone = make<CNote>();
    for (const P<CNote>& note : {first, gone, second, third}) in->addListener(note.get());
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
    for (const P<CNote>& note : {second, third}) in->removeListener(note.get());

    // It can be started again.
    first->onBlock = nullptr;
    in->start();
    EXPECT_TRUE(waitFor([&] { return first->blocks > 3; }));
    in->close();
    in->removeListener(first.get());
}

TEST_F(AudioDevice, LetsListenersAskAndLeaveWhileItRecords) {
    const P<CNote> keen = make<CNote>(), brief = make<CNote>();
    keen->onBlock = [&] { static_cast<void>(in->getPosition() + in->getStatus()); };
    bool present = true;
    brief->onBlock = [&] { EXPECT_TRUE(present); };
    in->addListener(keen.get());
    in->open(makeFormat(16, 3));
    in->start();
    for (int i = 1; i <= 20; ++i) {
        present = true;
        in->addListener(brief.get());
        ASSERT_TRUE(waitFor([&] { return brief->blocks >= i; }));
        in->removeListener(brief.get());
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
    const size_t files = count("/proc/self/fd");
    const size_t threads = count("/proc/self/task");
    for (int i = 0; i < 50; ++i) use();
    EXPECT_EQ(count("/proc/self/fd"), files);
    EXPECT_EQ(count("/proc/self/task"), threads);
}

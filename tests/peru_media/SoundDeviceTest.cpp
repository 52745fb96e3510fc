// Real sound through a private sound server.
#include "peru/GlobalObjFactory.h"
#include "peru/media/Errors.h"
#include "peru/media/ISystem.h"
#include "support/SoundServer.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <memory>
#include <mutex>
#include <random>
#include <string>
#include <thread>

using namespace peru::media;
using namespace tests;
using peru::P;

namespace {

class SoundDevice : public testing::Test {
protected:
    static constexpr size_t kFrameBytes = CSoundServer::kFrameBytes;

    // Each test has a sound server of its own.
    void TearDown() override { peru::CGlobalObjFactory::shutdown(); }

    static P<CAudioFormat> getFormat() { return peru::make<CAudioFormat>(CSoundServer::kRate, 2, 16); }
    static std::string makeNoise(double seconds) {
        std::string noise(static_cast<size_t>(seconds * CSoundServer::kRate) * kFrameBytes, '\0');
        std::mt19937 random(7);
        for (char& byte : noise) byte = static_cast<char>(random() | 1); // never silent
        return noise;
    }
    template <class Condition> static bool waitFor(Condition condition) {
        const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(60);
        while (!condition() && std::chrono::steady_clock::now() < end)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        return condition();
    }
    static std::string withoutSilence(std::string samples) {
        std::string sound;
        for (size_t at = 0; at + kFrameBytes <= samples.size(); at += kFrameBytes)
            if (samples[at] != 0) sound.append(samples, at, kFrameBytes);
        return sound;
    }
};

// Records what it receives, up to a limit.
class CEars : public peru::CObject, public IAudioInDeviceListener {
public:
    bool onAudioData(const void* data, int64_t size) override {
        std::lock_guard lock(m_mutex);
        m_heard.append(static_cast<const char*>(data), static_cast<size_t>(size));
        ++blocks;
        return m_heard.size() < limit;
    }
    void onVolume(const P<CVolumeInfo>& volume) override {
        if (volume->getLeft() > loudest) {
            loudest = volume->getLeft();
            loudestRight = volume->getRight();
        }
    }
    std::string getHeard() const {
        std::lock_guard lock(m_mutex);
        return m_heard;
    }

    std::atomic<size_t> limit{SIZE_MAX};
    std::atomic<int> blocks{0};
    std::atomic<double> loudest{0}, loudestRight{0};

private:
    mutable std::mutex m_mutex;
    std::string m_heard;
};

} // namespace

TEST_F(SoundDevice, PlaysEverySampleAcrossAPause) {
    const CSoundServer server;
    const std::string noise = makeNoise(1.5);
    const P<IAudioOutDevice> device = getSystem()->getDefaultOutDevice();
    ASSERT_TRUE(device);
    const std::unique_ptr<CProcess> ears = server.listen();
    device->open(getFormat());
    device->write(noise.data(), static_cast<int64_t>(noise.size()));
    device->start();
    EXPECT_EQ(device->getStatus(), kDeviceRunning);
    ASSERT_TRUE(waitFor([&] { return device->getPosition() > 0.5; }));
    device->pause();
    EXPECT_EQ(device->getStatus(), kDeviceIdle);
    const int64_t queued = device->getQueuedSize();
    EXPECT_GT(queued, 0);
    // The position advances to the end of what the system has buffered, and no further.
    double still = -1;
    ASSERT_TRUE(waitFor([&] {
        const double before = std::exchange(still, device->getPosition());
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
        return before == still;
    }));
    EXPECT_LE(still,
              static_cast<double>(noise.size() - static_cast<size_t>(queued)) / kFrameBytes / 44100 + 1e-6);
    device->start();
    ASSERT_TRUE(waitFor([&] { return device->getPosition() >= 1.5 - 1e-6; }));
    ASSERT_TRUE(waitFor([&] { return withoutSilence(ears->readOut()).size() >= noise.size(); }));
    device->close();
    EXPECT_TRUE(withoutSilence(ears->readOut()) == noise);
}

TEST_F(SoundDevice, RecordsEverySampleUntilItsListenerHasEnough) {
    const CSoundServer server(EMicrophone::isolated);
    const std::string noise = makeNoise(1.5);
    const P<IAudioInDevice> device = getSystem()->getDefaultInDevice();
    ASSERT_TRUE(device);
    const P<CEars> ears = peru::make<CEars>();
    device->addListener(ears.get());
    device->open(getFormat());
    device->start();
    ASSERT_TRUE(waitFor([&] { return ears->blocks > 0; }));
    EXPECT_EQ(server.play(noise)->wait().exitCode, 0);
    ASSERT_TRUE(waitFor([&] { return withoutSilence(ears->getHeard()).size() >= noise.size(); }));
    EXPECT_NE(ears->getHeard().find(noise), std::string::npos);
    EXPECT_GT(ears->loudest, 0.1);
    EXPECT_GT(device->getPosition(), 1.4);

    ears->limit = 0;
    ASSERT_TRUE(waitFor([&] { return device->getStatus() == kDeviceIdle; }));
    const int blocks = ears->blocks;
    device->close();
    EXPECT_EQ(ears->blocks, blocks);
    EXPECT_FALSE(device->isOpened());
    device->removeListener(ears.get());
}

TEST_F(SoundDevice, RecordsEightBitsWithGainAndLevels) {
    const CSoundServer server(EMicrophone::isolated);
    const P<IAudioInDevice> device = getSystem()->getDefaultInDevice();
    const P<CEars> ears = peru::make<CEars>();
    device->addListener(ears.get());
    device->setGain(2.0);
    device->open(peru::make<CAudioFormat>(CSoundServer::kRate, 2, 8));
    device->start();
    std::string sound;
    for (int i = 0; i < CSoundServer::kRate; ++i)
        sound += std::string("\0\x10\0\xD0", 4); // 16 and -48 of 128
    const auto player = server.play(sound);
    const std::string expected{"\xA0\x20\xA0\x20\xA0\x20"}; // unsigned, twice as loud
    EXPECT_TRUE(waitFor(
        [&] { return ears->getHeard().find(expected) != std::string::npos && ears->loudestRight > 0; }));
    EXPECT_NEAR(ears->loudest, 32 / 127.0, 1e-9);
    EXPECT_NEAR(ears->loudestRight, 96 / 127.0, 1e-9);
    device->close();
    device->removeListener(ears.get());
}

TEST_F(SoundDevice, MayBeGoneBeforeItIsOpened) {
    CSoundServer server;
    const P<IAudioOutDevice> out = getSystem()->getDefaultOutDevice();
    const P<IAudioInDevice> in = getSystem()->getDefaultInDevice();
    ASSERT_TRUE(out && in);
    server.kill();
    EXPECT_THROW(out->open(getFormat()), CMediaException);
    EXPECT_THROW(in->open(getFormat()), CMediaException);
    EXPECT_FALSE(out->isOpened() || in->isOpened());
}

TEST_F(SoundDevice, TellsThatItHasGone) {
    CSoundServer server;
    const P<IAudioOutDevice> out = getSystem()->getDefaultOutDevice();
    const P<IAudioOutDevice> paused = getSystem()->getDefaultOutDevice();
    const P<IAudioInDevice> in = getSystem()->getDefaultInDevice();
    const P<CEars> ears = peru::make<CEars>();
    ASSERT_TRUE(out && in);
    in->addListener(ears.get());
    in->open(getFormat());
    in->start();
    out->open(getFormat());
    const std::string noise = makeNoise(10);
    out->write(noise.data(), static_cast<int64_t>(noise.size()));
    out->start();
    paused->open(getFormat());
    paused->start();
    paused->pause();
    ASSERT_TRUE(waitFor([&] { return out->getPosition() > 0.1 && ears->blocks > 0; }));
    server.kill();
    EXPECT_TRUE(waitFor([&] { return out->getStatus() == kDeviceIdle && in->getStatus() == kDeviceIdle; }));
    EXPECT_THROW(out->getPosition(), CMediaException);
    const auto isMissed = [&] {
        try {
            paused->getPosition();
            return false;
        } catch (const CMediaException&) {
            return true;
        }
    };
    EXPECT_TRUE(waitFor(isMissed));
    EXPECT_NO_THROW(paused->stop());
    EXPECT_THROW(out->write(noise.data(), 4), CMediaException);
    out->close();
    in->close();
    in->removeListener(ears.get());
    EXPECT_FALSE(out->isOpened() || in->isOpened());
}

// Decoding ahead on another thread.
#include "support/ReadAhead.h"
#include "plugins/PluginFixture.h"
#include "sonora2/context/SonoraError.h"

#include <condition_variable>
#include <functional>
#include <thread>

namespace tests {

namespace {

using namespace sonora2::plugins;

constexpr int kChunkFrames = 8192;

// Numbers its frames.
class CCountingDecoder : public IDecoder {
public:
    explicit CCountingDecoder(std::function<void(int64_t)> onRead) : m_onRead(std::move(onRead)) {}
    SDecodedMedia open(const SDecoderOptions&) override { return {}; }
    void close() override {}
    int read(uint8_t* pcm, int frames) override {
        m_onRead(m_position);
        for (int i = 0; i < frames; ++i, ++m_position) std::memcpy(pcm + i * 4, &m_position, 4);
        return frames;
    }
    void seek(int64_t frame) override { m_position = frame; }

private:
    std::function<void(int64_t frame)> m_onRead; // before each chunk
    int64_t m_position = 0;
};

class ReadAhead : public CPluginTest {
protected:
    // Reads that many chunks and checks that their frames follow each other.
    static void expectChunks(CReadAhead& queue, int count, int64_t& frame) {
        for (int i = 0; i < count; ++i) {
            const P<IAudioChunk> chunk = queue.next();
            ASSERT_TRUE(chunk);
            for (uint32_t at = 0; at < chunk->getSize(); at += 4, ++frame)
                ASSERT_EQ(0, std::memcmp(&frame, chunk->getData() + at, 4));
        }
    }
    CChunkProducer makeProducer(IDecoder& decoder, int chunks) {
        return {context, SMediaFile(toURI(folder / "x")),
                decoder, {kFormat, int64_t{chunks} * kChunkFrames},
                kFormat, {}};
    }

    static constexpr SPcmFormat kFormat{44100, 2, 2};
};

TEST_F(ReadAhead, SlowDecoder_DeliversWhatThereIs) {
    for (const int ready : {1, 2, 4, 12, 20}) {
        SCOPED_TRACE(ready);
        std::mutex mutex;
        std::condition_variable released;
        bool isReleased = false, isLate = false;
        CCountingDecoder decoder([&](int64_t frame) {
            std::unique_lock lock(mutex);
            isLate =
                isLate || (frame >= ready * kChunkFrames &&
                           !released.wait_for(lock, std::chrono::seconds(20), [&] { return isReleased; }));
        });
        CChunkProducer producer = makeProducer(decoder, 40);
        CReadAhead queue(producer, 16);
        int64_t frame = 0;
        expectChunks(queue, ready, frame);
        {
            std::lock_guard lock(mutex);
            isReleased = true;
        }
        released.notify_all();
        expectChunks(queue, 40 - ready, frame);
        EXPECT_FALSE(isLate) << "waited for chunks that were not needed";
        EXPECT_FALSE(queue.next());
        EXPECT_TRUE(queue.isEnded());
    }
}

TEST_F(ReadAhead, Failure_FollowsTheChunksBeforeIt) {
    std::mt19937 random(3);
    for (const size_t limit : {0, 2, 3, 16})
        for (int round = 0; round < 8; ++round) {
            const int good = static_cast<int>(random() % 50);
            const auto linger = [](size_t times) {
                while (times-- > 0) std::this_thread::yield();
            };
            CCountingDecoder decoder([&, pauses = std::mt19937(round)](int64_t frame) mutable {
                linger(pauses() % 4 == 0 ? pauses() % 50 : 0);
                if (frame == int64_t{good} * kChunkFrames) fail("broken");
            });
            CChunkProducer producer = makeProducer(decoder, 60);
            CReadAhead queue(producer, limit);
            int64_t frame = 0;
            for (int i = 0; i < good; ++i) {
                expectChunks(queue, 1, frame);
                linger(random() % 4 == 0 ? random() % 50 : 0);
            }
            EXPECT_THROW(queue.next(), sonora2::common::CSonoraError);
            EXPECT_FALSE(queue.next());
            EXPECT_TRUE(queue.isEnded());
        }
}

} // namespace

} // namespace tests

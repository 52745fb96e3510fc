// What crosses the pipe, byte for byte, and pictures that are fetched ahead.
#include "peru/Errors.h"
#include "peru/remote/RemoteException.h"
#include "peru/streams/DataStreams.h"
#include "peru/streams/MemoryIOStream.h"
#include "sonora2/boxed/AudioChunkRemote.h"
#include "sonora2/boxed/AudioRun.h"
#include "sonora2/boxed/PicturePrefetch.h"
#include "sonora2/boxed/RemoteLog.h"
#include "sonora2/media/AudioChunk.h"
#include "sonora2/pictures/RGBPicture.h"

#include "support/FakeMedia.h"

#include <gmock/gmock.h>

#include <atomic>
#include <chrono>
#include <thread>

namespace tests {

namespace {

using namespace sonora2::common;
using namespace std::string_literals;
using peru::CString;
using peru::make;
using peru::P;
using sonora2::audio::CAudioChunk;
using sonora2::audio::CAudioChunkRemote;

P<peru::IMemoryManager> memory() {
    return make<peru::CMemoryManager>();
}

P<sonora2::audio::IAudioChunk> chunkOf(double time, const std::string& bytes) {
    const P<peru::IMemoryBlock> block = make<peru::CMemoryBlock>(static_cast<int64_t>(bytes.size()));
    std::copy(bytes.begin(), bytes.end(), block->getData());
    return make<CAudioChunk>(time, block);
}

TEST(BoxedWire, Chunk_HasItsToldForm) {
    const std::string bytes = "\x01\0\0\0\0\0\0\xf8\x3f\x03\0\0\0abc"s;
    EXPECT_EQ(bytes, serialise(make<CAudioChunkRemote>(memory(), chunkOf(1.5, "abc"))));
    EXPECT_EQ("\0"s, serialise(make<CAudioChunkRemote>(memory())));

    const auto chunk = make<CAudioChunkRemote>(memory());
    deserialise(chunk, bytes);
    EXPECT_EQ(1.5, chunk->getTimestamp());
    EXPECT_EQ("abc", bytesOf(chunk));
    const std::string large(5'000'000, 'x'); // more than is allocated on the word of the peer
    deserialise(chunk, serialise(make<CAudioChunkRemote>(memory(), chunkOf(2.0, large))));
    EXPECT_TRUE(bytesOf(chunk) == large);
    // A size that lies: the error of the stream, and no chunk.
    EXPECT_THROW(deserialise(chunk, "\x01\0\0\0\0\0\0\xf8\x3f\xff\xff\xff\xff"s + "abc"), peru::CException);
    EXPECT_FALSE(chunk->getChunk());
}

TEST(BoxedWire, Run_CrossesWithItsEnd) {
    const auto run = make<sonora2::audio::CAudioRun>(memory()),
               read = make<sonora2::audio::CAudioRun>(memory());
    run->chunks = {chunkOf(0.0, "ab"), chunkOf(0.5, ""), nullptr};
    run->isEOF = true;
    run->duration = 0.75;
    run->failure = CString::fromUTF8("broken");
    deserialise(read, serialise(run));
    ASSERT_EQ(3u, read->chunks.size());
    EXPECT_EQ("ab", bytesOf(read->chunks[0]));
    EXPECT_EQ(0u, read->chunks[1]->getSize());
    EXPECT_FALSE(read->chunks[2]);
    EXPECT_TRUE(read->isEOF);
    EXPECT_EQ(0.75, read->duration);
    EXPECT_TRUE(read->failure->equals("broken"));
    // More chunks than a run has, each of one byte.
    EXPECT_THROW(deserialise(read, "\x41\0\0\0"s + std::string(100, '\0')), peru::CRemoteException);
}

TEST(BoxedWire, LogEntries_KeepSeverityAndText) {
    class CLines : public peru::CObject, public ILogManager {
    public:
        void log(int32_t severity, const P<peru::IString>& text) override {
            lines.push_back(std::to_string(severity) + CString::toStdString(text));
        }
        void logException(const peru::CException& exception) override { log(9, exception.getDescription()); }
        std::vector<std::string> lines;
    };
    const auto lines = make<CLines>();
    replayLog(CString::fromUTF8(encodeLogEntry(kSeverityWarning, CString::fromUTF8("two\nlines \x1e")) +
                                encodeLogException(peru::CError("why", "what")) + "\x1e" + "plain"),
              *lines);
    EXPECT_THAT(lines->lines, testing::ElementsAre("1two\nlines ", "9why", "2", "2plain"));
}

TEST(PicturePrefetch, Pictures_ArriveInOrderUntilTheEndAndFromANewPosition) {
    std::atomic<int> next{0};
    CPicturePrefetch prefetch([&](const std::function<void()>& locked, P<ISonoraPicture>& picture) {
        locked();
        const int number = next++;
        if (number == 27) throw 27;
        if (number == 6) return CPicturePrefetch::EFetched::end;
        std::this_thread::sleep_for(std::chrono::milliseconds(2)); // on its way
        picture = make<CRGBPicture>(memory(), number);
        return CPicturePrefetch::EFetched::picture;
    });
    prefetch.start();
    EXPECT_EQ(0.0, prefetch.peek()->getTimestamp());
    for (int i = 0; i < 6; ++i) {
        EXPECT_FALSE(prefetch.isAtEnd());
        EXPECT_EQ(i, prefetch.take()->getTimestamp());
    }
    EXPECT_TRUE(prefetch.isAtEnd());
    EXPECT_FALSE(prefetch.take()) << "the end does not wait";
    next = 20;
    prefetch.clear();
    for (int i = 20; i < 27; ++i) EXPECT_EQ(i, prefetch.take()->getTimestamp());
    EXPECT_FALSE(prefetch.isAtEnd());
    EXPECT_THROW(prefetch.take(), peru::CError);
    prefetch.stop();
    EXPECT_FALSE(prefetch.isRunning());
}

} // namespace

} // namespace tests

// What crosses the pipe, byte for byte, and pictures that are fetched ahead.
#include "peru/Errors.h"
#include "peru/streams/DataStreams.h"
#include "peru/streams/MemoryIOStream.h"
#include "sonora2/ScriptedMedia.h"
#include "sonora2/boxed/AudioChunkRemote.h"
#include "sonora2/boxed/PicturePrefetch.h"
#include "sonora2/boxed/RemoteLog.h"
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
using sonora2::audio::CAudioChunkRemote;

P<peru::IMemoryManager> memory() {
    return make<peru::CMemoryManager>();
}

TEST(BoxedWire, ChunkOfAnySize_IsReadAsItsBytesArrive) {
    const auto chunk = make<CAudioChunkRemote>(memory());
    const std::string large(5'000'000, 'x'); // more than is allocated on the word of the peer
    deserialise(chunk, serialise(make<CAudioChunkRemote>(memory(), makeChunk(2.0, large))));
    EXPECT_TRUE(bytesOf(chunk) == large);
    // A size that lies: the error of the stream, and no chunk.
    EXPECT_THROW(deserialise(chunk, "\x01\0\0\0\0\0\0\xf8\x3f\xff\xff\xff\xff"s + "abc"), peru::CException);
    EXPECT_FALSE(chunk->getChunk());
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
        if (number == 40) { // its position has changed when it fails
            next = 20;
            prefetch.clear();
            throw 40;
        }
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
    next = 40;
    prefetch.clear();
    for (int i = 20; i < 27; ++i) EXPECT_EQ(i, prefetch.take()->getTimestamp());
    EXPECT_FALSE(prefetch.isAtEnd());
    EXPECT_THROW(prefetch.take(), peru::CError);
    prefetch.stop();
    EXPECT_FALSE(prefetch.isRunning());
}

} // namespace

} // namespace tests

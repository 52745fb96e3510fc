#include "sonora2/media/AudioChunk.h"

#include "sonora2/ScriptedMedia.h"
#include "sonora2/media/AudioStreamInfos.h"
#include "sonora2/plugins/ISonoraPlugin.h"
#include "sonora2/plugins/ParameterRecord.h"

#include <gtest/gtest.h>

namespace {

using peru::make;
using peru::P;
using sonora2::audio::CAudioChunk;
using sonora2::audio::CAudioInfo;
using sonora2::audio::CAudioStreamInfos;
using tests::deserialise;
using tests::serialise;
using namespace peru::literals;

TEST(AudioChunk, TravelsWithItsTimestampAndItsValidBytes) {
    for (const size_t size : {0u, 1u, 70000u}) {
        const P<CAudioChunk> chunk = tests::makeChunk(1.25, tests::patternBytes(size));
        const std::string form = serialise(chunk);
        EXPECT_EQ(form.size(), 8 + 4 + size); // without the block's unused capacity
        const P<CAudioChunk> copy = make<CAudioChunk>(0.0, nullptr);
        deserialise(copy, form);
        EXPECT_EQ(copy->getTimestamp(), 1.25);
        EXPECT_EQ(tests::bytesOf(copy), tests::patternBytes(size));
    }
}

TEST(AudioStreamInfos, TravelInTheirOrderAndReplaceWhatWasThere) {
    const P<CAudioStreamInfos> infos = make<CAudioStreamInfos>();
    infos->add(make<CAudioInfo>(4, "commentary"_s, "en"_s));
    infos->add(make<CAudioInfo>(-1));
    const P<CAudioStreamInfos> copy = make<CAudioStreamInfos>();
    copy->add(make<CAudioInfo>(9, "old"_s, "old"_s));
    deserialise(copy, serialise(infos));
    ASSERT_EQ(copy->getStreamCount(), 2);
    EXPECT_EQ(copy->getStreamInfo(0)->getStreamIndex(), 4);
    EXPECT_EQ(serialise(copy), serialise(infos));
    for (int index : {-1, 2}) EXPECT_THROW(copy->getStreamInfo(index), peru::CException);
}

TEST(AudioStreamInfos, TakeNoMoreMemoryThanTheBytesThatCome) {
    const P<CAudioStreamInfos> infos = make<CAudioStreamInfos>();
    std::string form("\xff\xff\xff\x7f", 4); // two billion streams, of which one is present
    form += std::string(12, '\0');
    EXPECT_THROW(deserialise(infos, form), peru::CException);
    EXPECT_LE(infos->getStreamCount(), 1);
    deserialise(infos, "\xff\xff\xff\xff");
    EXPECT_EQ(infos->getStreamCount(), 0);
}

using SSourceParams = sonora2::common::ISonoraPlugin::SSourceParams;
using SFormatParams = sonora2::common::ISonoraPlugin::SFormatParams;

TEST(ParameterRecord, TakesAsMuchAsTheSenderFilled) {
    for (int32_t stated : {20, 1000000, 16, 12, 10, 4, 3, 0, -5, INT32_MIN}) {
        SCOPED_TRACE(stated);
        const SSourceParams sent{stated, 1, {}, 44100, 2, 3};
        // On the heap, exactly as large as stated, so that a sanitizer detects any byte read beyond.
        const size_t real = static_cast<size_t>(std::clamp<int32_t>(stated, 4, sizeof(sent)));
        const std::unique_ptr<uint8_t[]> bytes(new uint8_t[real]);
        std::memcpy(bytes.get(), &sent, real);
        SSourceParams expected{20, 0, {}, 0, 0, 0};
        std::memcpy(reinterpret_cast<uint8_t*>(&expected) + 4, bytes.get() + 4, real - 4);
        const SSourceParams got = sonora2::common::receiveRecord<SSourceParams>(bytes.get());
        EXPECT_EQ(std::memcmp(&got, &expected, sizeof(got)), 0);
    }
}

TEST(ParameterRecord, NeverReadsBehindWhatArrived) {
    SFormatParams sent;
    sent.video[91] = 9;
    sent.nSampleRate = 48000;
    for (size_t available = 0; available <= sizeof(sent); ++available) {
        const std::vector<uint8_t> bytes(reinterpret_cast<uint8_t*>(&sent),
                                         reinterpret_cast<uint8_t*>(&sent) + available);
        const auto got = sonora2::common::receiveRecord<SFormatParams>(bytes.data(), available);
        EXPECT_EQ(got.nSize, 116);
        EXPECT_EQ(got.video[91], available >= 96 ? 9 : 0);
        const size_t rateBytes = std::clamp<size_t>(available, 96, 100) - 96;
        EXPECT_EQ(got.nSampleRate, 48000 & ((int64_t{1} << (8 * rateBytes)) - 1));
        EXPECT_EQ(got.nBytesPerSample, 0);
    }
    const SSourceParams none = sonora2::common::receiveRecord<SSourceParams>(nullptr);
    EXPECT_EQ(none.nSize, 20);
    EXPECT_EQ(none.nSampleRate, 0);
}

} // namespace

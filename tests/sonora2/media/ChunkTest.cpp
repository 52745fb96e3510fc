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
using sonora2::audio::CAudioStreamInfos;
using tests::deserialise;
using tests::serialise;

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

TEST(AudioStreamInfos, TakeNoMoreMemoryThanTheBytesThatCome) {
    const P<CAudioStreamInfos> infos = make<CAudioStreamInfos>();
    std::string form("\xff\xff\xff\x7f", 4); // two billion streams, of which one is present
    form += std::string(12, '\0');
    EXPECT_THROW(deserialise(infos, form), peru::CException);
    EXPECT_LE(infos->getStreamCount(), 1);
    deserialise(infos, "\xff\xff\xff\xff");
    EXPECT_EQ(infos->getStreamCount(), 0);
    for (int index : {-1, 0}) EXPECT_THROW(infos->getStreamInfo(index), peru::CInvalidArgError);
}

TEST(ParameterRecord, TakesWhatTheSenderFilledAndWhatArrived) {
    using SSourceParams = sonora2::common::ISonoraPlugin::SSourceParams;
    for (int32_t stated : {20, 1000000, 16, 12, 10, 4, 3, 0, -5, INT32_MIN})
        for (size_t available = 0; available <= sizeof(SSourceParams); ++available) {
            SCOPED_TRACE(std::to_string(stated) + ", " + std::to_string(available));
            const SSourceParams sent{stated, 1, {}, 44100, 2, 3};
            // On the heap, exactly as large as it may be read, so that a sanitizer detects any byte beyond.
            const size_t real = std::min<size_t>(available, std::clamp<int32_t>(stated, 4, sizeof(sent)));
            const std::unique_ptr<uint8_t[]> bytes(new uint8_t[real]);
            std::memcpy(bytes.get(), &sent, real);
            SSourceParams expected{20, 0, {}, 0, 0, 0};
            if (real > 4) std::memcpy(reinterpret_cast<uint8_t*>(&expected) + 4, bytes.get() + 4, real - 4);
            const auto got = sonora2::common::receiveRecord<SSourceParams>(bytes.get(), available);
            EXPECT_EQ(std::memcmp(&got, &expected, sizeof(got)), 0);
        }
    EXPECT_EQ(sonora2::common::receiveRecord<SSourceParams>(nullptr).nSize, 20);
}

} // namespace

#include "sonora2/encoding/AudioEncoder.h"

#include "sonora2/ScriptedMedia.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/context/SonoraError.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <stdexcept>

namespace {

using peru::make;
using peru::P;
using sonora2::common::CAudioEncoder;
using tests::CScriptedFormat;
using tests::CScriptedListener;
using tests::CScriptedSource;

constexpr size_t kFrameBytes = 4;
constexpr size_t kBlock = 4608;

class AudioEncoder : public testing::Test {
protected:
    P<sonora2::common::ISonoraContext> context = make<sonora2::audio::CSonoraContextAudio>();
    P<CScriptedSource> source = make<CScriptedSource>();
    P<CScriptedFormat> format = make<CScriptedFormat>();
    P<CScriptedListener> listener = make<CScriptedListener>();

    P<CAudioEncoder> makeEncoder() { return make<CAudioEncoder>(context, source, format); }
};

TEST_F(AudioEncoder, WritesEverythingInFixedBlocksAndTellsTheProgress) {
    source->media = tests::patternBytes((3 * kBlock + 100) * kFrameBytes);
    const P<CAudioEncoder> encoder = makeEncoder();
    EXPECT_EQ(encoder->getSampleRate(), 44100);
    EXPECT_FALSE(source->isOpened());
    encoder->addListener(listener.get());
    encoder->encode();

    EXPECT_EQ(format->written, source->media);
    EXPECT_EQ(format->sizes, (std::vector<size_t>{kBlock * kFrameBytes, kBlock * kFrameBytes,
                                                  kBlock * kFrameBytes, 100 * kFrameBytes}));
    EXPECT_DOUBLE_EQ(format->timestamps.back(), 3.0 * kBlock / 44100);
    // At the start, before each block, at the end.
    ASSERT_EQ(listener->fractions.size(), 6u);
    EXPECT_EQ(listener->fractions.front(), 0.0);
    EXPECT_EQ(listener->fractions.back(), 1.0);
    EXPECT_TRUE(std::is_sorted(listener->fractions.begin(), listener->fractions.end()));
    EXPECT_EQ(listener->integers, std::vector<int32_t>(6, 0));
    EXPECT_FALSE(source->isOpened());
    EXPECT_FALSE(format->isOpened());
    encoder->removeListener(listener.get());
}

TEST_F(AudioEncoder, StopsNormallyAtAListenersWish) {
    source->media = tests::patternBytes(20 * kBlock * kFrameBytes);
    const P<CScriptedListener> later = make<CScriptedListener>();
    listener->stopFrom = 0.5;
    const P<CAudioEncoder> encoder = makeEncoder();
    encoder->addListener(listener.get());
    encoder->addListener(later.get());
    encoder->encode();

    EXPECT_EQ(format->written, source->media.substr(0, source->media.size() / 2));
    EXPECT_FALSE(source->isOpened());
    EXPECT_FALSE(format->isOpened());
    EXPECT_EQ(listener->fractions.back(), 0.5);
    EXPECT_EQ(later->fractions.size(),
              listener->fractions.size() - 1); // listeners after the one that stops are not called
    encoder->removeListener(later.get());

    // A stop takes effect at the first block: the result of the first call is ignored.
    source->media.resize(2 * kBlock * kFrameBytes);
    format->written.clear();
    listener->fractions.clear();
    listener->stopFrom = -1.0;
    encoder->encode();
    EXPECT_EQ(listener->fractions.size(), 2u);
    EXPECT_EQ(format->opens, 2);
    EXPECT_TRUE(format->written.empty());
    EXPECT_FALSE(format->isOpened());

    source->media.clear(); // an empty file of an empty source
    encoder->encode();
    EXPECT_EQ(format->closes, 3);
    EXPECT_TRUE(format->written.empty());
    encoder->removeListener(listener.get());
}

TEST_F(AudioEncoder, FinishesTheFilesWhenAnExceptionLeftIt) {
    source->media = tests::patternBytes(5 * kBlock * kFrameBytes);
    format->beforeWrite = [&] {
        if (format->sizes.size() == 2) throw std::runtime_error("disk full");
    };
    format->beforeClose = [] { throw std::runtime_error("still full"); };
    P<CAudioEncoder> encoder = makeEncoder();
    EXPECT_THROW(encoder->encode(), std::runtime_error);
    EXPECT_TRUE(source->isOpened());
    EXPECT_TRUE(format->isOpened());
    const int closes = source->closes;
    encoder.reset();
    EXPECT_EQ(source->closes, closes + 1);
    EXPECT_FALSE(source->isOpened());
    EXPECT_EQ(format->closes, 1);
}

TEST_F(AudioEncoder, ClosesWhatItOpenedWhenItCannotBeMade) {
    source->beforeFormat = [] { throw std::runtime_error("no header"); };
    EXPECT_THROW(makeEncoder(), std::runtime_error);
    EXPECT_EQ(source->opens, 1);
    EXPECT_FALSE(source->isOpened());
}

TEST_F(AudioEncoder, RefusesAReaderThatContradictsItself) {
    source->media = tests::patternBytes(100 * kFrameBytes);
    const P<CAudioEncoder> encoder = makeEncoder();
    source->eofAnswers = {false, true, false};
    EXPECT_EQ(tests::errorOf([&] { encoder->encode(); }),
              "CAudioEncoder: AudioChunk=NULL but SampleReader hat samples!");
    source->eofAnswers = {false, true, true, true};
    encoder->encode();
    EXPECT_EQ(format->written, "");
}

TEST_F(AudioEncoder, HoldsNoReferenceAndLetsListenersLeaveDuringACall) {
    source->media = tests::patternBytes(4 * kBlock * kFrameBytes);
    const P<CScriptedListener> second = make<CScriptedListener>();
    const P<CAudioEncoder> encoder = makeEncoder();
    encoder->addListener(listener.get());
    encoder->addListener(second.get());
    listener->onCall = [&] {
        if (listener->fractions.size() < 2) return;
        encoder->removeListener(listener.get());
        listener->onCall = nullptr;
    };
    encoder->encode();
    EXPECT_EQ(listener->fractions.size(), 2u);
    EXPECT_FALSE(encoder->hasListener(listener.get()));
    EXPECT_TRUE(encoder->hasListener(second.get()));
    EXPECT_EQ(second->fractions.back(), 1.0);
    EXPECT_TRUE(encoder->removeListener(second.get()));
    EXPECT_FALSE(encoder->removeListener(second.get()));
}

} // namespace

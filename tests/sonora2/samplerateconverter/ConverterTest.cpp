#include "sonora2/samplerateconverter/SampleRateConverter.h"

#include "sonora2/ScriptedMedia.h"
#include "support/Environment.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <random>

namespace {

using peru::make;
using peru::P;
using sonora2::samplerateconverter::CSampleRateConverter;

using Samples = std::vector<int16_t>;

Samples makeNoise(size_t count, unsigned seed = 1) {
    std::mt19937 random(seed);
    Samples samples(count);
    for (int16_t& sample : samples) sample = static_cast<int16_t>(random());
    return samples;
}

// From 20 Hz to the Nyquist frequency, just below full scale, the same in each channel.
Samples makeSweep(int rate, int channels, double seconds) {
    const int frames = static_cast<int>(rate * seconds);
    Samples samples;
    double phase = 0.0;
    for (int i = 0; i < frames; ++i) {
        phase += 2 * M_PI * 20.0 * std::pow(rate / 40.0, static_cast<double>(i) / frames) / rate;
        samples.insert(samples.end(), channels, static_cast<int16_t>(32000 * std::sin(phase)));
    }
    return samples;
}

Samples samplesOf(const P<sonora2::audio::IAudioChunk>& chunk) {
    Samples samples(chunk->getSize() / sizeof(int16_t));
    std::memcpy(samples.data(), chunk->getData(), samples.size() * sizeof(int16_t));
    return samples;
}

struct SShape {
    int srcRate, srcChannels, srcBytes, dstRate, dstChannels, dstBytes;
};

P<CSampleRateConverter> makeConverter(const SShape& s, bool planar = false) {
    return make<CSampleRateConverter>(s.srcRate, s.srcChannels, s.srcBytes, s.dstRate, s.dstChannels,
                                      s.dstBytes, nullptr, planar);
}

template <class T> std::string convertAll(CSampleRateConverter& converter, const std::vector<T>& input) {
    return tests::bytesOf(converter.convert(input.data(), static_cast<int>(input.size() * sizeof(T))));
}

std::string flush(CSampleRateConverter& converter) {
    return tests::bytesOf(converter.convert(nullptr, 0));
}

std::string convertInCuts(const SShape& shape, const std::string& input, unsigned seed, int largestCut) {
    std::mt19937 random(seed);
    const P<CSampleRateConverter> converter = makeConverter(shape);
    std::string output;
    const size_t frameBytes = static_cast<size_t>(shape.srcChannels) * shape.srcBytes;
    for (size_t at = 0; at < input.size();) {
        const size_t cut = std::min((1 + random() % largestCut) * frameBytes, input.size() - at);
        output += tests::bytesOf(converter->convert(input.data() + at, static_cast<int>(cut)));
        at += cut;
    }
    return output + flush(*converter);
}
std::string convertInCuts(const SShape& shape, const Samples& input, unsigned seed, int largestCut) {
    const std::string bytes(reinterpret_cast<const char*>(input.data()), input.size() * sizeof(int16_t));
    return convertInCuts(shape, bytes, seed, largestCut);
}

TEST(SampleRateConverter, OutputDoesNotDependOnHowTheInputIsCut) {
    const SShape shapes[] = {
        {44100, 2, 2, 48000, 2, 2}, {48000, 2, 2, 44100, 2, 2}, {96000, 1, 2, 44100, 2, 2},
        {44100, 2, 2, 44100, 2, 2}, {8000, 6, 2, 192000, 2, 2}, {192000, 2, 2, 8000, 1, 2},
    };
    for (const SShape& shape : shapes) {
        SCOPED_TRACE(testing::Message() << shape.srcRate << " -> " << shape.dstRate);
        const Samples input = makeNoise(static_cast<size_t>(shape.srcRate) * 3 / 2 * shape.srcChannels);
        const std::string small = convertInCuts(shape, input, 1, 200);
        const std::string large = convertInCuts(shape, input, 2, 3000);
        const P<CSampleRateConverter> converter = makeConverter(shape);
        std::string whole = convertAll(*converter, input);
        EXPECT_LE(converter->getOutputPosition(), uint32_t{CSampleRateConverter::kMaxOutputFrames});
        // A call returns a bounded number of frames: flush until the expected length is reached.
        for (int round = 0; whole.size() < small.size() && round < 200; ++round) whole += flush(*converter);
        EXPECT_EQ(small, large);
        EXPECT_EQ(small, whole.substr(0, small.size()));
    }
}

TEST(SampleRateConverter, AFlushGivesExactlyOneSecondThatEndsInSilence) {
    const SShape shapes[] = {{44100, 2, 2, 48000, 2, 2},
                             {48000, 1, 1, 44100, 1, 2},
                             {96000, 3, 4, 44100, 3, 2},
                             {44100, 6, 3, 44100, 6, 2},
                             {8000, 2, 2, 96000, 1, 2}};
    for (const SShape& shape : shapes) {
        SCOPED_TRACE(testing::Message() << shape.srcRate << " -> " << shape.dstRate);
        const P<CSampleRateConverter> converter = makeConverter(shape);
        const size_t bytes = static_cast<size_t>(shape.srcRate) * shape.srcChannels * shape.srcBytes;
        const std::string second = tests::patternBytes(bytes / 4);
        size_t before = 0;
        for (int quarter = 0; quarter < 4; ++quarter)
            before += converter->convert(second.data(), static_cast<int>(second.size()))->getSize();
        const Samples tail = samplesOf(converter->convert(nullptr, 0));
        const size_t outputSecond = static_cast<size_t>(shape.dstRate) * shape.dstChannels;
        EXPECT_EQ(tail.size(), outputSecond);
        EXPECT_LT(before, outputSecond * 2);
        EXPECT_NE(tail, Samples(outputSecond, 0)) << "the delayed end of the audio comes out";
        EXPECT_EQ(Samples(tail.begin() + tail.size() / 2, tail.end()),
                  Samples(tail.size() - tail.size() / 2, 0));
        EXPECT_EQ(converter->getOutputPosition() * 2 * shape.dstChannels, before + tail.size() * 2);
    }
}

TEST(SampleRateConverter, TimestampsCountTheFramesHandedOut) {
    const P<CSampleRateConverter> converter = makeConverter({44100, 1, 2, 48000, 1, 2});
    const Samples input = makeNoise(10000);
    double frames = 0;
    EXPECT_EQ(converter->convert(input.data(), 1)->getSize(), 0u) << "not even one frame";
    EXPECT_EQ(converter->getOutputPosition(), 0u);
    for (int i = 0; i < 5; ++i) {
        if (i == 2) converter->setStartTime(100.0);
        const P<sonora2::audio::IAudioChunk> chunk = converter->convert(input.data(), 20000);
        EXPECT_DOUBLE_EQ(chunk->getTimestamp(), frames / 48000 + (i < 2 ? 0.0 : 100.0));
        frames += chunk->getSize() / 2;
    }
    EXPECT_EQ(converter->getOutputPosition(), frames);
}

// Samples of each width that carry the same 16 bits must give the same output.
TEST(SampleRateConverter, TakesEveryWidthForItsUpperBytes) {
    const Samples noise = makeNoise(20000);
    Samples coarse;
    std::vector<uint8_t> one, three, four;
    for (int16_t sample : noise) {
        const uint8_t low = static_cast<uint8_t>(sample), high = static_cast<uint8_t>(sample >> 8);
        const uint8_t dropped = static_cast<uint8_t>(sample * 7);
        one.push_back(high ^ 0x80);
        coarse.push_back(static_cast<int16_t>(sample & ~0xff));
        three.insert(three.end(), {dropped, low, high});
        four.insert(four.end(), {dropped, dropped, low, high});
    }
    const auto run = [](const auto& input, int bytes) {
        return convertAll(*makeConverter({44100, 2, bytes, 48000, 2, 2}), input);
    };
    const std::string expected = run(noise, 2);
    EXPECT_GT(expected.size(), 40000u);
    EXPECT_EQ(run(three, 3), expected);
    EXPECT_EQ(run(four, 4), expected);
    EXPECT_EQ(run(one, 1), run(coarse, 2));

    std::vector<uint8_t> unaligned(noise.size() * 2 + 1);
    std::memcpy(unaligned.data() + 1, noise.data(), noise.size() * 2);
    const P<CSampleRateConverter> converter = makeConverter({44100, 2, 2, 48000, 2, 2});
    EXPECT_EQ(tests::bytesOf(converter->convert(unaligned.data() + 1, static_cast<int>(noise.size() * 2))),
              expected);
}

TEST(SampleRateConverter, NarrowsAndOrdersItsOutput) {
    for (const auto& [srcChannels, dstChannels] : {std::pair{2, 1}, {2, 2}, {2, 3}, {6, 6}}) {
        SCOPED_TRACE(dstChannels);
        const Samples noise = makeNoise(6 * 4000);
        SShape shape{44100, srcChannels, 2, 48000, dstChannels, 2};
        const P<CSampleRateConverter> interleaved = makeConverter(shape);
        const Samples frames =
            samplesOf(interleaved->convert(noise.data(), static_cast<int>(noise.size() * sizeof(int16_t))));
        const size_t count = frames.size() / dstChannels;
        ASSERT_GT(count, 4000u);

        std::string narrow, planar(frames.size() * 2, '\0'), narrowPlanar(frames.size(), '\0');
        for (size_t i = 0; i < frames.size(); ++i) {
            narrow += static_cast<char>(static_cast<uint8_t>((frames[i] / 65535.0 + 0.5) * 255.0));
            const size_t place = i % dstChannels * count + i / dstChannels;
            std::memcpy(&planar[place * 2], &frames[i], 2);
            narrowPlanar[place] = narrow.back();
        }
        EXPECT_EQ(convertAll(*makeConverter(shape, true), noise), planar);
        shape.dstBytes = 1;
        EXPECT_EQ(convertAll(*makeConverter(shape), noise), narrow);
        EXPECT_EQ(convertAll(*makeConverter(shape, true), noise), narrowPlanar);
    }
}

// Planes that a row leaves out must be silent at the end of the pipeline, whatever the pool's blocks held
// before.
TEST(SampleRateConverter, LeavesTheGapsOfTheMatricesSilent) {
    const struct {
        int srcChannels, dstChannels;
        std::vector<int> sounding; // source channels with a signal
        std::vector<int> silent;   // planes without one
    } cases[] = {
        {1, 3, {0}, {0, 1}},    {1, 6, {0}, {0, 1, 3, 4, 5}}, {2, 6, {0, 1}, {5}},
        {3, 6, {0, 1, 2}, {5}}, {2, 3, {0}, {1, 2}},          {6, 2, {3, 4, 5}, {0, 1}},
        {6, 1, {5}, {0}},       {6, 6, {0}, {1, 2, 3, 4, 5}}, {6, 6, {3, 4, 5}, {0, 1, 2, 3, 4, 5}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(testing::Message() << c.srcChannels << " -> " << c.dstChannels);
        const P<peru::CMemoryManager> pool = make<peru::CMemoryManager>();
        for (int round = 0; round < 12; ++round) {
            const P<peru::IMemoryBlock> dirty = pool->getBlock(16384 << (round % 4));
            std::memset(dirty->getData(), 0x33, static_cast<size_t>(dirty->getSize()));
        }
        const auto converter =
            make<CSampleRateConverter>(44100, c.srcChannels, 2, 48000, c.dstChannels, 2, pool);
        Samples input(static_cast<size_t>(c.srcChannels) * 8000, 0);
        const Samples noise = makeNoise(8000);
        for (int channel : c.sounding)
            for (size_t i = 0; i < noise.size(); ++i) input[i * c.srcChannels + channel] = noise[i];
        for (int call = 0; call < 3; ++call) {
            const Samples frames =
                samplesOf(converter->convert(input.data(), static_cast<int>(input.size() * 2)));
            std::vector<int> silent;
            for (int plane = 0; plane < c.dstChannels; ++plane) {
                bool sounds = false;
                for (size_t i = plane; i < frames.size(); i += c.dstChannels) sounds |= frames[i] != 0;
                if (!sounds) silent.push_back(plane);
            }
            EXPECT_EQ(silent, c.silent);
        }
    }
}

TEST(SampleRateConverter, SaysWhyItCannotConvert) {
    const struct {
        SShape shape;
        const char* text;
    } cases[] = {
        {{44100, 5, 2, 44100, 2, 2}, "CSampleRateConverter: no suitable ChannelConversion found for 5 -> 2"},
        {{44100, 4, 2, 44100, 4, 2}, "CSampleRateConverter: no suitable ChannelConversion found for 4 -> 4"},
        {{44100, 0, 2, 44100, 2, 2}, "CSampleRateConverter: no suitable ChannelConversion found for 0 -> 2"},
        {{44100, 2, 5, 44100, 2, 2},
         "CSampleRateConverter: could not convert samples to short SrcBytesPerSample 5"},
        {{44100, 2, 0, 44100, 2, 2},
         "CSampleRateConverter: could not convert samples to short SrcBytesPerSample 0"},
        {{44100, 2, 2, 44100, 2, 5},
         "CSampleRateConverter: could not convert samples from short DstBytesPerSample 5"},
        {{0, 2, 2, 44100, 2, 2},
         "CSampleRateConverter: no filter could be made for 0 -> 44100 frames per second"},
        {{2000000000, 6, 4, 1, 1, 1},
         "CSampleRateConverter: no filter could be made for 2000000000 -> 1 frames per second"},
    };
    for (const auto& c : cases) {
        const P<CSampleRateConverter> converter = makeConverter(c.shape);
        for (const void* data :
             {static_cast<const void*>("0123456789abcdef"), static_cast<const void*>(nullptr)})
            EXPECT_EQ(tests::errorOf<peru::CError>([&] { converter->convert(data, 16); }), c.text);
    }
}

TEST(SampleRateConverter, KeepsItsMemoryInThePool) {
    const P<peru::CMemoryManager> pool = make<peru::CMemoryManager>();
    const auto converter = make<CSampleRateConverter>(44100, 2, 3, 48000, 2, 1, pool);
    const std::vector<uint8_t> input(4608 * 6, 7);
    int64_t cached = 0;
    for (int call = 0; call < 50; ++call) {
        converter->convert(input.data(), static_cast<int>(input.size()));
        if (call == 2) cached = pool->getCachedBytes();
    }
    EXPECT_GT(cached, 0);
    EXPECT_EQ(pool->getCachedBytes(), cached);
}

// Samples of any width, left-justified in 32 bits.
std::vector<int64_t> widen(const std::string& bytes, size_t width) {
    std::vector<int64_t> samples(bytes.size() / width);
    for (size_t i = 0; i < samples.size(); ++i) {
        int32_t sample = 0;
        std::memcpy(reinterpret_cast<char*>(&sample) + 4 - width, &bytes[i * width], width);
        samples[i] = sample;
    }
    return samples;
}

// The same filter in another program is the judge of the settings and of the seams between calls.
TEST(SampleRateConverter, MatchesThePeerWithTheSameFilter) {
    const tests::CTempFolder folder;
    const std::string filter = "filter_size=16:phase_shift=10:linear_interp=0:exact_rational=0:cutoff=1.0:"
                               "filter_type=kaiser:kaiser_beta=9:resampler=swr";
    const struct {
        int srcRate, dstRate, bytes;
        bool isSweep, isBest;
    } cases[] = {{44100, 48000, 2, false, false}, {44100, 48000, 2, true, false},
                 {48000, 44100, 2, true, false},  {96000, 44100, 2, false, false},
                 {96000, 44100, 2, true, false},  {44100, 48000, 3, false, false},
                 {96000, 44100, 4, false, false}, {96000, 44100, 4, true, true}};
    for (const auto& c : cases) {
        SCOPED_TRACE(testing::Message() << c.srcRate << " -> " << c.dstRate << ", " << c.bytes << " bytes");
        const Samples input = c.isSweep ? makeSweep(c.srcRate, 2, 3.0) : makeNoise(c.srcRate * 2 * 3, 5);
        std::string bytes;
        for (const int16_t sample : input) {
            // Noise uses all bits of a wider sample, at half scale to leave room for overshoot.
            const int32_t wide = sample * 0x8000 + (c.isSweep ? 0 : (sample * 12347) & 0x7fff);
            const auto* from = c.bytes == 2 ? reinterpret_cast<const char*>(&sample)
                                            : reinterpret_cast<const char*>(&wide) + 4 - c.bytes;
            bytes.append(from, c.bytes);
        }
        const std::string in = folder.write("in.raw", bytes).string(), out = (folder / "out.raw").string();
        const std::string width = std::to_string(c.bytes * 8), target = std::to_string(c.dstRate);
        const std::string command = "ffmpeg -nostdin -v error -y -f s" + width + "le -ar " +
                                    std::to_string(c.srcRate) + " -ac 2 -i " + in +
                                    " -af aresample=" + target +
                                    ":internal_sample_fmt=" + (c.bytes == 2 ? "s16p:" : "s32p:") +
                                    (c.isBest ? "resampler=soxr:precision=28" : filter) + " -f s" + width +
                                    "le -ar " + target + " -ac 2 " + out;
        ASSERT_EQ(std::system(command.c_str()), 0);
        const std::vector<int64_t> expected = widen(tests::readFile(out), c.bytes);
        const tests::CEnvironment best("TONEWRIGHT_RESAMPLER", c.isBest ? "best" : "");
        const SShape shape{c.srcRate, 2, c.bytes, c.dstRate, 2, c.bytes};
        const std::vector<int64_t> actual = widen(convertInCuts(shape, bytes, 4, 4000), c.bytes);

        // The peer does not flush its filter with silence: its last samples are ignored.
        const size_t count = expected.size() - (c.isBest ? 8000 : 128);
        ASSERT_GT(count, static_cast<size_t>(c.dstRate) * 5);
        ASSERT_GE(actual.size(), count);
        int64_t worst = 0;
        for (size_t i = 0; i < count; ++i) worst = std::max(worst, std::abs(actual[i] - expected[i]));
        EXPECT_LE(worst, int64_t{2} << (8 * (4 - c.bytes))) << "two steps of the width";
    }
}

} // namespace

// Floating-point samples.
#include "plugins/PluginFixture.h"

#include "sonora2/context/SonoraError.h"
#include "sonora2/encoding/AudioEncoder.h"
#include "sonora2/media/IClippingPrevention.h"
#include "sonora2/media/IFloatSamples.h"

namespace tests {

namespace {

using sonora2::common::CAudioEncoder;
using sonora2::common::IClippingPrevention;
using sonora2::common::IFloatSamples;

class Float : public CPluginTest {
protected:
    // Random bits are numbers of all magnitudes, infinities and NaN.
    std::string writeRandom(int bytes) {
        std::mt19937 random(static_cast<unsigned>(bytes));
        std::string raw(static_cast<size_t>(20011 * 2 * bytes), '\0');
        for (char& byte : raw) byte = static_cast<char>(random());
        const std::string coder = "f" + std::to_string(bytes * 8) + "le";
        folder.write("raw", raw);
        run("ffmpeg -v error -y -f " + coder + " -ar 44100 -ac 2 -i raw -c copy in.wav");
        return raw;
    }
    std::string decodeFloat(const std::string& name, int bytes) const {
        const std::string coder = "f" + std::to_string(bytes * 8) + "le";
        return run("ffmpeg -v error -i " + name + " -f " + coder + " -c:a pcm_" + coder + " -");
    }
    void encode(const P<IAudioSource>& source, const P<IAudioFormat>& format) {
        peru::make<CAudioEncoder>(context, source, format)->encode();
    }
};

TEST_F(Float, PassesUnchangedWhereBothFilesHoldIt) {
    const SShape shape{44100, 2, 4};
    for (const int bytes : {4, 8}) {
        const std::string raw = writeRandom(bytes);
        P<IAudioSource> source = openOwn(folder / "in.wav", "sonora2_wav");
        const std::string integers = readAll(source);
        for (const SFormatCase& row : kFormatCases) {
            if (!row.lossless) continue;
            SCOPED_TRACE(std::string(row.extension) + ", " + std::to_string(bytes));
            const std::string name = "x." + std::string(row.extension);
            P<IAudioFormat> format = makeFormat(folder / name, shape);
            source->close();
            source->open();
            source->skipToTime(11.0 / 44100);
            const auto target = peru::interfaceCast<IFloatSamples>(format);
            if (std::string(row.plugin) != "sonora2_wav") {
                EXPECT_FALSE(target->canUseFloat(bytes));
                encode(source, format);
                EXPECT_TRUE(read(folder / name, shape) == integers.substr(11 * 8));
                continue;
            }
            target->useFloat(bytes);
            const int64_t estimate = format->getEstimatedSizeBytes(20000 / 44100.0);
            encode(source, format);
            EXPECT_EQ(estimate, static_cast<int64_t>(std::filesystem::file_size(folder / name)));
            EXPECT_TRUE(decodeFloat(name, bytes) == raw.substr(static_cast<size_t>(11 * 2 * bytes)));
            // The agreement ends with the job.
            EXPECT_FALSE(source->isOpened());
            EXPECT_EQ(4, format->getBytesPerSample());
            source->open();
            EXPECT_TRUE(readAll(source) == integers);
            EXPECT_EQ(20011 / 44100.0, source->getDuration());
        }
        // Another width, a source whose format was chosen, and another rate.
        EXPECT_FALSE(peru::interfaceCast<IFloatSamples>(makeFormat(folder / "y.wav"))->canUseFloat(bytes));
        for (const auto& [from, rate] : {std::pair{openSource(folder / "in.wav", shape), 44100},
                                         std::pair{openOwn(folder / "in.wav", "sonora2_wav"), 48000}}) {
            encode(from, makeFormat(folder / "y.wav", {rate, 2, 4}));
            EXPECT_TRUE(read(folder / "y.wav", {rate, 2, 4}) == integers);
            EXPECT_EQ("PCM signed 32 bit", codecOf(openSource(folder / "y.wav", {rate, 2, 4})));
        }
    }
}

TEST_F(Float, FailedJob_ReturnsTheSourceToIntegers) {
    writeRandom(4);
    P<IAudioSource> source = openOwn(folder / "in.wav", "sonora2_wav");
    P<IAudioFormat> format = makeFormat(folder / "missing" / "x.wav", {44100, 2, 4});
    const auto encoder = peru::make<CAudioEncoder>(context, source, format);
    EXPECT_THROW(encoder->encode(), sonora2::common::CSonoraError);
    EXPECT_FALSE(source->isOpened());
    EXPECT_EQ(4, format->getBytesPerSample());
    encode(source, makeFormat(folder / "x.flac", {44100, 2, 4}));
    source->open();
    EXPECT_TRUE(read(folder / "x.flac", {44100, 2, 4}) == readAll(source));
}

TEST_F(Float, BeyondFullScale_IsReportedOrPrevented) {
    // 0.5 s at 6 dB above full scale, then 0.5 s at half of it.
    for (const char* coder : {"pcm_f32le", "pcm_f64le"}) {
        const auto path = folder / "x.wav";
        run("ffmpeg -v error -y -f lavfi -i 'aevalsrc=exprs=if(lt(t\\,0.5)\\,2\\,0.5):s=8000:d=1' -c:a " +
            std::string(coder) + " x.wav");
        log->lines.clear();
        P<IAudioSource> source = openSource(path, {8000, 1, 4});
        readAll(source);
        source->skipToTime(0.0);
        readAll(source);
        source->close();
        EXPECT_EQ(std::vector{path.string() + ": clipped 4000 samples, peak +6.0 dB"}, log->lines);

        log->lines.clear();
        source->open();
        peru::interfaceCast<IClippingPrevention>(source)->setClippingPrevention(true);
        source->skipToTime(0.25); // what is skipped counts, too
        const std::string pcm = readAll(source);
        source->close();
        EXPECT_EQ(std::vector{path.string() + ": reduced by 6.0 dB to prevent clipping"}, log->lines);
        ASSERT_EQ(6000u * 4, pcm.size());
        for (const auto& [frame, expected] :
             {std::pair{0, 0x7FFFFFFF}, {2000, 0x20000000}, {5999, 0x20000000}}) {
            int32_t sample;
            std::memcpy(&sample, &pcm[static_cast<size_t>(frame) * 4], 4);
            EXPECT_NEAR(expected, sample, 256) << frame;
        }
    }
}

} // namespace

} // namespace tests

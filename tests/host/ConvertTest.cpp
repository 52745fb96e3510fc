#include "host/Program.h"

using namespace tests;

namespace {

class Convert : public CProgramTest {
protected:
    nlohmann::json probe(const std::string& file) {
        return nlohmann::json::parse(
            peer({"ffprobe", "-v", "error", "-of", "json", "-show_entries",
                  "stream=codec_name,sample_rate,channels:format=duration,bit_rate", file}));
    }
    SSound decodeByPeer(const std::string& file) {
        peer({"ffmpeg", "-v", "error", "-y", "-i", file, "-c:a", "pcm_s16le", "-f", "wav", "-bitexact",
              "judge.wav"});
        // Written to a pipe, the header would have no sizes.
        return readWav("judge.wav");
    }
    static std::vector<std::string> command(const std::string& output,
                                            const std::vector<std::string>& options) {
        return with({"convert", "in.wav", "-f", "-o", output}, options);
    }
    int property(const std::string& file, const char* option) {
        return std::stoi(peer({"metaflac", option, file}));
    }
};

} // namespace

TEST_F(Convert, KeepsEverySampleThroughFlac) {
    std::vector<SSound> sounds;
    std::vector<std::string> there{"convert", "--to", "flac", "-j", "4"},
        back{"convert", "--to", ".wav", "--directory", "back"};
    std::filesystem::create_directory(folder / "back");
    for (int bits : {8, 16, 24})
        for (int channels = 1; channels <= 6; ++channels) {
            // Not a whole number of blocks.
            sounds.push_back(makeNoise(channels == 5 ? 96000 : 44100, channels, bits, 10007));
            const std::string name = describe(sounds.back());
            write(name + ".wav", sounds.back());
            there.push_back(name + ".wav");
            back.push_back(name + ".flac");
        }
    succeed(there);
    succeed(back);
    for (const SSound& sound : sounds) {
        SCOPED_TRACE(describe(sound));
        const std::string flac = describe(sound) + ".flac";
        peer({"flac", "-t", "-s", "-w", flac});
        EXPECT_EQ(property(flac, "--show-sample-rate"), sound.rate);
        EXPECT_EQ(property(flac, "--show-channels"), sound.channels);
        EXPECT_EQ(property(flac, "--show-bps"), sound.bits);
        EXPECT_EQ(property(flac, "--show-total-samples"), static_cast<int>(sound.frames()));
        peer({"flac", "-d", "-s", "-f", "-o", "judge.wav", flac});
        EXPECT_TRUE(readWav("judge.wav") == sound) << "by the peer";
        EXPECT_TRUE(readWav("back/" + describe(sound) + ".wav") == sound) << "back again";
    }
}

TEST_F(Convert, ReadsWhatPeersWrite) {
    const SSound sound = makeNoise(32000, 2, 24, 20011);
    write("in.wav", sound);
    for (const char* file : {"peer.flac", "peer.aiff", "peer.w64", "peer.caf", "peer.wav"}) {
        peer({"sox", "in.wav", file});
        succeed({"convert", file, "-f", "-o", "out.wav"});
        EXPECT_TRUE(readWav("out.wav") == sound) << file;
    }
    // Codecs without a sample width are decoded to 16 bits.
    write("in.wav", makeTone(8000, 1, 16, 0.5));
    peer({"sox", "in.wav", "-e", "mu-law", "peer.au"});
    peer({"lame", "--quiet", "-b", "64", "in.wav", "peer.mp3"});
    peer({"ffmpeg", "-v", "error", "-y", "-i", "in.wav", "peer.ogg"});
    for (const char* file : {"peer.au", "peer.mp3", "peer.ogg"}) {
        SCOPED_TRACE(file);
        succeed({"convert", file, "-f", "-o", "out.wav"});
        const SSound heard = readWav("out.wav");
        EXPECT_EQ(describe(heard), "8000_1ch_16bit");
        EXPECT_NEAR(heard.seconds(), 0.5, 2 * 1152.0 / 8000);
        EXPECT_NEAR(measureFrequency(heard, 0), 440, 5);
    }
}

TEST_F(Convert, WritesWhatPeersRead) {
    constexpr double kSeconds = 3.3, kFrame = 1152 / 44100.0;
    const SSound tone = makeTone(44100, 2, 16, kSeconds, 500);
    write("in.wav", tone);
    static const struct {
        const char* file;
        std::vector<std::string> options;
        const char* codec;
        double tolerance; // one frame of the codec, in seconds
        double bitRate;   // expected, or 0
    } kCases[] = {
        {"a.flac", {}, "flac", 0, 0},
        {"a.wav", {}, "pcm_s16le", 0, 0},
        {"a.aiff", {}, "pcm_s16be", 0, 0},
        {"a.ogg", {}, "vorbis", 0, 0},
        {"vbr.mp3", {"--quality", "0.8"}, "mp3", kFrame, 0},
        {"abr.mp3", {"--bitrate", "160k", "--min-bitrate", "64k", "--max-bitrate", "320k"}, "mp3", kFrame, 0},
        {"cbr.mp3", {"--bitrate", "192k"}, "mp3", kFrame, 192000},
    };
    for (const auto& expected : kCases) {
        SCOPED_TRACE(expected.file);
        succeed(command(expected.file, expected.options));
        const nlohmann::json told = probe(expected.file);
        EXPECT_EQ(told["streams"][0]["codec_name"], expected.codec);
        EXPECT_EQ(told["streams"][0]["sample_rate"], "44100");
        EXPECT_EQ(told["streams"][0]["channels"], 2);
        EXPECT_NEAR(std::stod(told["format"]["duration"].get<std::string>()), kSeconds,
                    expected.tolerance * 2 + 1e-4);
        if (expected.bitRate > 0) {
            EXPECT_NEAR(std::stod(told["format"]["bit_rate"].get<std::string>()), expected.bitRate,
                        expected.bitRate / 50);
        }
        const SSound heard = decodeByPeer(expected.file);
        EXPECT_NEAR(heard.seconds(), kSeconds, expected.tolerance + 1e-9);
        for (int channel : {0, 1}) {
            EXPECT_NEAR(measureFrequency(heard, channel), 500 * (channel + 1), 2);
            EXPECT_NEAR(measureLevel(heard, channel), measureLevel(tone, channel), 0.02);
        }
    }
}

// A tone between the two limits of Nyquist must not come back as another one.
TEST_F(Convert, BestResamplerLeavesNoAlias) {
    peer({"sox", "-n", "-r", "96000", "-b", "24", "-c", "1", "high.wav", "synth", "1", "sine", "23000", "vol",
          "0.5"});
    double peaks[2] = {};
    for (const bool best : {false, true}) {
        succeed({"convert", "high.wav", "-f", "-o", "low.wav", "--rate", "44100", "--resampler",
                 best ? "best" : "default"});
        const std::string stats =
            run({"sox", (folder / "low.wav").string(), "-n", "trim", "0.1", "0.8", "stat"}).err;
        peaks[best] = std::stod(stats.substr(stats.find("Maximum amplitude:") + 18));
    }
    EXPECT_GT(peaks[0], 0.05);
    EXPECT_LT(peaks[1], 0.001);
}

TEST_F(Convert, MeansWhatTheOptionsSay) {
    static const struct {
        SSound input;
        const char* output;
        std::vector<std::string> options;
        int rate, channels, bits; // of the output; bits 0 if the codec has no sample width
    } kCases[] = {
        // Unchanged if the target can hold it
        {makeTone(48000, 2, 24, 0.4), "a.mp3", {}, 48000, 2, 0},
        {makeTone(8000, 1, 8, 0.4), "a.wav", {}, 8000, 1, 8},
        {makeTone(96000, 6, 24, 0.2), "a.wav", {}, 96000, 6, 24},
        // Otherwise changed to a format that the target can hold
        {makeTone(96000, 6, 24, 0.4), "a.mp3", {}, 48000, 2, 0},
        {makeTone(11000, 1, 16, 0.4), "a.mp3", {}, 11025, 1, 0},
        {makeTone(4000, 1, 16, 0.4), "a.mp3", {}, 8000, 1, 0},
        // As requested
        {makeTone(44100, 2, 16, 0.4), "a.flac", {"--rate", "48000", "--channels", "1"}, 48000, 1, 16},
        {makeTone(44100, 1, 16, 0.4), "a.ogg", {"--channels", "2"}, 44100, 2, 0},
        {makeTone(44100, 2, 16, 0.4), "a.wav", {"--bits", "8"}, 44100, 2, 8},
        {makeTone(44100, 2, 24, 0.4), "a.flac", {"--bits", "16"}, 44100, 2, 16},
        {makeTone(44100, 2, 24, 0.4), "a.wav", {"--rate", "48000"}, 48000, 2, 24},
        {makeTone(96000, 6, 24, 0.4), "a.mp3", {"--rate", "32000", "--channels", "1"}, 32000, 1, 0},
    };
    for (const auto& expected : kCases) {
        SCOPED_TRACE(describe(expected.input) + " to " + expected.output + " " +
                     testing::PrintToString(expected.options));
        write("in.wav", expected.input);
        succeed(command(expected.output, expected.options));
        EXPECT_EQ(peer({"soxi", "-r", expected.output}), std::to_string(expected.rate) + "\n");
        EXPECT_EQ(peer({"soxi", "-c", expected.output}), std::to_string(expected.channels) + "\n");
        if (expected.bits > 0) {
            EXPECT_EQ(peer({"soxi", "-b", expected.output}), std::to_string(expected.bits) + "\n");
        }
        const SSound heard = decodeByPeer(expected.output);
        EXPECT_NEAR(heard.seconds(), expected.input.seconds(), 2 * 1152.0 / expected.rate);
        if (expected.channels == expected.input.channels && heard.channels == expected.channels) {
            EXPECT_NEAR(measureFrequency(heard, 0), 440, 12);
        }
    }
}

TEST_F(Convert, NeverGivesUpWhatWasAskedFor) {
    write("in.wav", makeTone(44100, 6, 16, 0.1));
    for (const std::vector<std::string>& options : std::initializer_list<std::vector<std::string>>{
             {"--channels", "6"},
             {"--rate", "7000"},
             {"--rate", "96000", "--channels", "2"},
         }) {
        const std::string message = fail(command("out.mp3", options));
        EXPECT_TRUE(has(message, "in.wav: "));
        EXPECT_TRUE(has(message, "out.mp3"));
        EXPECT_EQ(list(), std::set<std::string>{"in.wav"});
    }
    fail({"convert", "in.wav", "-o", "out.flac", "--channels", "9"});
    fail({"convert", "in.wav", "-o", "out.ogg", "--bitrate", "1k"});
    EXPECT_EQ(list(), std::set<std::string>{"in.wav"});
}

TEST_F(Convert, SalvagesAndPreventsClippingOnRequest) {
    const SSound noise = makeNoise(44100, 1, 16, 100'000);
    write("damaged.wav", noise);
    peer({"flac", "-s", "-0", "damaged.wav"});
    std::string bytes = readFile(folder / "damaged.flac");
    std::fill_n(bytes.begin() + static_cast<ptrdiff_t>(bytes.size() / 2), 3000, '\0');
    folder.write("damaged.flac", bytes);
    EXPECT_TRUE(has(fail({"convert", "damaged.flac", "-o", "out.wav"}), "is damaged at"));
    SProcessResult result = tonewright({"convert", "damaged.flac", "-o", "out.wav", "--salvage"});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_TRUE(has(result.err, "is damaged: "));
    const SSound salvaged = readWav("out.wav");
    ASSERT_EQ(salvaged.frames(), noise.frames());
    for (const size_t frame : {0u, 40'000u, 60'000u, 99'999u})
        EXPECT_EQ(salvaged.at(frame, 0), noise.at(frame, 0));

    // 6 dB above full scale, then half of full scale.
    peer({"ffmpeg", "-v", "error", "-f", "lavfi", "-i", "aevalsrc=exprs=if(lt(t\\,0.5)\\,2\\,0.5):s=8000:d=1",
          "-c:a", "pcm_f32le", "loud.wav"});
    succeed({"convert", "loud.wav", "-o", "float.wav"});
    EXPECT_EQ(probe("float.wav")["streams"][0]["codec_name"], "pcm_f32le") << "as it is";
    for (const auto& [option, warning, second] : {std::tuple{"--no-tags", "Clipped 4000 samples", 0.5},
                                                  {"--prevent-clipping", "Reduced by 6.0 dB", 0.25}}) {
        result = tonewright({"convert", "-f", "loud.wav", "-o", "out.wav", "--bits", "16", option});
        EXPECT_EQ(result.exitCode, 0);
        EXPECT_TRUE(has(result.err, warning));
        EXPECT_NEAR(readWav("out.wav").at(100, 0), 1.0, 1e-4);
        EXPECT_NEAR(readWav("out.wav").at(6000, 0), second, 1e-4);
    }
}

TEST_F(Convert, ObeysQualityAndBitRate) {
    write("in.wav", makeNoise(44100, 2, 16, 44100));
    const auto size = [&](const char* extension, const char* option, const char* value) {
        const std::string output = std::string("out.") + extension;
        succeed({"convert", "in.wav", "-f", "-o", output, option, value});
        return std::filesystem::file_size(folder / output);
    };
    EXPECT_LT(size("mp3", "--quality", "0.0") * 5, size("mp3", "--quality", "1.0") * 4);
    EXPECT_NEAR(static_cast<double>(size("mp3", "--bitrate", "320K")), 40000, 3000);
    // The sound must be compressible
    write("in.wav", makeTone(44100, 2, 16, 2));
    EXPECT_LT(size("flac", "--quality", "1.0"), size("flac", "--quality", "0.01"));
}

TEST_F(Convert, NeedsNoMoreMemoryForHoursThanForAMinute) {
    constexpr long kLimit = 30 * 1024; // kB
    const SSound silence{8000, 1, 16, {}};
    for (uint32_t seconds : {60u, 6 * 3600u}) {
        const uint32_t bytes = seconds * 16000;
        folder.write("in.wav", makeWavHeader(silence, bytes));
        std::filesystem::resize_file(folder / "in.wav", 44 + bytes); // sparse
        const SProcessResult result = tonewright({"convert", "in.wav", "-f", "-o", "out.flac"});
        EXPECT_EQ(result.exitCode, 0) << result.err;
        EXPECT_EQ(property("out.flac", "--show-total-samples"), static_cast<int>(bytes / 2));
#ifndef TONEWRIGHT_SANITIZED
        EXPECT_LT(result.peakMemory, kLimit) << seconds << " seconds";
#else
        (void)kLimit;
#endif
    }
}

// Sound formats that libav reads, compared with another program's decoding.
#include "plugins/AvFixture.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/IFloatSamples.h"
#include "sonora2/media/ISalvage.h"

namespace tests {

namespace {

struct SSoundCase {
    const char* name;
    const char* options; // for ffmpeg
    int width;           // bytes per sample as delivered
    int frames = 0;      // if the end is trimmed, which the other program does not do
    int rate = 44100;
    int channels = 2;
};

const SSoundCase kSoundCases[] = {
    {"aac.m4a", "-c:a aac -aac_pns 0", 2, 60007},
    {"fragments.m4a", "-c:a aac -aac_pns 0 -movflags +frag_keyframe+empty_moov -frag_duration 300000", 2,
     60007 + 1024},
    {"alac16.m4a", "-c:a alac -sample_fmt s16p", 2, 60007},
    {"alac24.m4b", "-c:a alac", 3, 60007},
    {"six.m4a", "-c:a aac -aac_pns 0", 2, 60007, 48000, 6},
    {"x.aac", "-c:a aac -aac_pns 0", 2},
    {"x.opus", "-c:a libopus", 2},
    {"x.spx", "-c:a libspeex", 2, 0, 16000, 1},
    {"opus.mka", "-c:a libopus", 2},
    {"flac.mka", "-c:a flac -sample_fmt s16", 2},
    {"x.weba", "-c:a libvorbis -f webm", 2},
    {"x.wv", "-c:a wavpack -sample_fmt s16p", 2},
    {"float.wv", "-c:a wavpack -sample_fmt fltp", 4},
    {"x.tta", "", 3},
    {"x.ac3", "", 2},
    {"x.eac3", "", 2, 0, 48000, 6},
    {"x.dts", "-c:a dca -strict -2", 2},
    {"x.thd", "-c:a truehd -strict -2", 3, 0, 48000, 2},
    {"x.wma", "-c:a wmav2", 2},
    {"x.asf", "-c:a wmav1", 2},
    {"x.adx", "", 2},
    {"x.gsm", "-c:a libgsm", 2, 0, 8000, 1},
    {"x.mp4", "-c:a aac -aac_pns 0", 2, 60007},
    {"x.mov", "-c:a pcm_s24le", 3, 60007},
    {"x.3gp", "-c:a aac -aac_pns 0", 2, 60007},
    {"x.flv", "-c:a libmp3lame", 2},
    {"aac.mkv", "-c:a aac -aac_pns 0", 2},
    {"vorbis.webm", "-c:a libvorbis", 2},
    {"mp3.avi", "-c:a libmp3lame", 2},
    {"x.mpg", "-c:a mp2", 2},
    {"x.ts", "-c:a aac -aac_pns 0", 2},
    {"x.nut", "-c:a pcm_f32le", 4},
};

class AvSound : public CAvTest, public testing::WithParamInterface<SSoundCase> {};

TEST_P(AvSound, File_IsReadAsAnotherProgramReadsIt) {
    const SSoundCase& row = GetParam();
    makeInput(row.rate, row.channels);
    encode(row.options, row.name);
    const P<IAudioSource> source = openAv(row.name);
    testing::internal::CaptureStderr();
    EXPECT_EQ(row.width, source->getBytesPerSample());
    const double estimate = source->getDuration();
    const std::string all = readAll(source);
    EXPECT_EQ("", testing::internal::GetCapturedStderr());

    const std::string peer = decodeByPeer(row.name, row.width);
    const size_t frameBytes = static_cast<size_t>(row.width) * source->getChannelCount();
    EXPECT_EQ(row.frames > 0 ? row.frames * frameBytes : peer.size(), all.size());
    EXPECT_TRUE(peer.starts_with(all));
    const double seconds = static_cast<double>(all.size() / frameBytes) / source->getSampleRate();
    EXPECT_DOUBLE_EQ(seconds, source->getDuration());
    EXPECT_NEAR(seconds, estimate, row.frames > 0 ? 0.001 : 0.1);

    // Codecs with noise or long memory do not settle completely after a skip.
    std::mt19937 random(5);
    for (int i = 0; i < 8; ++i) {
        const size_t frame = random() % (all.size() / frameBytes);
        source->skipToTime(static_cast<double>(frame) / source->getSampleRate());
        const std::string part = readAll(source, 40000);
        ASSERT_GE(all.size(), frame * frameBytes + part.size());
        const std::string expected = all.substr(frame * frameBytes, part.size());
        if (row.width > 2)
            EXPECT_TRUE(expected == part) << "frame " << frame;
        else
            EXPECT_LE(getDistance16(expected, part), 20) << "frame " << frame;
    }
    source->skipToTime(1e6);
    EXPECT_TRUE(source->isEOF());
    source->skipToTime(0.0);
    EXPECT_EQ(all.substr(0, 4000), readAll(source, 1).substr(0, 4000));
}

INSTANTIATE_TEST_SUITE_P(Types, AvSound, testing::ValuesIn(kSoundCases), [](const auto& row) {
    std::string name = row.param.name;
    std::ranges::replace(name, '.', '_');
    return name;
});

class AvFile : public CAvTest {};

// The default one is delivered unless another is selected, which may have another format.
TEST_F(AvFile, Soundtracks_AreListedAndSelected) {
    makeInput();
    run("ffmpeg -v error -i in.wav -i in.wav -i in.wav -map 0 -map 1 -map 2 -filter:a:1 areverse "
        "-filter:a:2 volume=0.5 -c:a flac -sample_fmt s16 -ac:a:2 1 -disposition:a:0 0 -disposition:a:1 "
        "default "
        "-metadata:s:a:1 language=ger -metadata:s:a:1 title=Kommentar -metadata:s:a:2 language=fre x.mkv");
    const auto peer = [this](int track) {
        return run("ffmpeg -v error -i x.mkv -map 0:a:" + std::to_string(track) + " -f s16le -");
    };
    for (const bool isBoxed : {false, true}) {
        SCOPED_TRACE(isBoxed);
        handler = peru::make<sonora2::common::CPluginHandler>(context, isBoxed);
        const P<IAudioSource> source = openAv("x.mkv");
        const auto infos = source->getAudioStreamInfos();
        ASSERT_EQ(3, infos->getStreamCount());
        for (const auto& [index, language] : {std::pair{0, "ger"}, {1, ""}, {2, "fre"}})
            EXPECT_EQ(language, text(infos->getStreamInfo(index)->getStreamLanguage()));
        EXPECT_EQ("Kommentar", text(infos->getStreamInfo(0)->getStreamName()));
        EXPECT_TRUE(peer(1) == readAll(source));
        source->skipToTime(0.5);
        source->setAudioStream(2); // one channel
        EXPECT_TRUE(peer(2).substr(22050 * 2) == readAll(source));
        EXPECT_EQ(1, source->getChannelCount());
        EXPECT_ANY_THROW(source->setAudioStream(3));
        source->close();
        source->setAudioStream(1);
        EXPECT_FALSE(source->isOpened());
        source->open();
        EXPECT_TRUE(peer(0) == readAll(source));
    }
}

// Files that ffmpeg cannot write.
TEST_F(AvFile, OtherEncodersFiles_AreReadAsAnotherProgramReadsThem) {
    makeInput();
    run("ffmpeg -v error -i in.wav -c:a pcm_s16le cd.wav");
    run("sox in.wav -r 8000 -c 1 x.amr-nb && mv x.amr-nb x.amr");
    std::vector<std::string> names{"x.amr", "x.dsf"};
    if (!run("command -v mpcenc || true").empty()) {
        run("mpcenc --silent cd.wav x.mpc");
        names.push_back("x.mpc");
    }
    writeDsf("x.dsf");
    for (const std::string& name : names) {
        SCOPED_TRACE(name);
        const P<IAudioSource> source = openAv(name);
        const std::string all = readAll(source);
        EXPECT_LT(4000u, all.size());
        EXPECT_TRUE(decodeByPeer(name) == all);
    }
}

TEST_F(AvFile, LongFile_IsSkippedInByItsTimestampsOrItsPackets) {
    const std::string pcm = makeMusic({}, 44100 * 9);
    folder.write("in.raw", pcm);
    run("ffmpeg -v error -f s16le -ar 44100 -ac 2 -i in.raw in.wav");
    const std::pair<const char*, const char*> files[] = {{"x.m4a", "-c:a aac -aac_pns 0"},
                                                         {"x.mkv", "-c:a aac -aac_pns 0"},
                                                         {"x.aac", "-c:a aac -aac_pns 0"},
                                                         {"x.opus", "-c:a libopus"},
                                                         {"x.wma", "-c:a wmav2"}};
    for (const auto& [name, options] : files) {
        SCOPED_TRACE(name);
        encode(options, name);
        const P<IAudioSource> source = openAv(name);
        const std::string all = readAll(source);
        const size_t frameBytes = 2u * source->getBytesPerSample();
        for (const double time : {8.3, 3.7, 7.0001, 1.5}) {
            source->skipToTime(time);
            const std::string part = readAll(source, 100000);
            const auto frame = static_cast<size_t>(std::ceil(time * source->getSampleRate() - 1e-3));
            EXPECT_LE(getDistance16(all.substr(frame * frameBytes, part.size()), part), 20) << time;
        }
    }
}

TEST_F(AvFile, FloatingPointSamples_PassUnchanged) {
    makeInput();
    encode("-c:a wavpack -sample_fmt fltp -af volume=3", "x.wv"); // exceeds full scale
    const P<IAudioSource> source = openAv("x.wv");
    const auto floats = peru::interfaceCast<sonora2::common::IFloatSamples>(source);
    ASSERT_TRUE(floats && floats->canUseFloat(4));
    const std::string start = readAll(source, 1);
    floats->useFloat(4);
    const std::string peer = run("ffmpeg -v error -i x.wv -f f32le -c:a pcm_f32le -");
    EXPECT_TRUE(peer.substr(start.size()) == readAll(source));
}

TEST_F(AvFile, Damage_IsAnErrorOrSalvaged) {
    makeInput();
    encode("", "x.tta");
    std::string bytes = readFile(folder / "x.tta");
    for (size_t i = 0; i < 40; ++i) bytes[bytes.size() / 2 + i] ^= 0x55; // in the first packet of two
    const auto path = folder.write("x.tta", bytes);
    try {
        readAll(openAv("x.tta"));
        FAIL();
    } catch (const sonora2::common::CSonoraError& error) {
        EXPECT_NE(std::string::npos, text(error.getDescription()).find("decode " + path.string() + " at "));
    }
    using namespace sonora2::common;
    context->setParameter(kSalvageParameterKey, kSalvageParameter, peru::newString("1"));
    EXPECT_EQ(kFrames * 6u, readAll(openAv("x.tta")).size());
    EXPECT_NE(std::string::npos, log->lines.back().find("replaced by silence"));
    context->setParameter(kSalvageParameterKey, kSalvageParameter, peru::newString("0"));

    folder.write("x.tta", bytes.substr(0, bytes.size() / 3));
    EXPECT_ANY_THROW(readAll(openAv("x.tta")));
    folder.write("no.m4a", "this is no sound");
    EXPECT_ANY_THROW(openAv("no.m4a"));
    // A playlist must not make the process read other files.
    folder.write("list.m4a", "#EXTM3U\n#EXT-X-TARGETDURATION:10\n#EXTINF:10,\nx.tta\n#EXT-X-ENDLIST\n");
    EXPECT_ANY_THROW(readAll(openAv("list.m4a")));
}

// Whatever is read is bounded by the file, and nothing but an exception stops it.
TEST_F(AvFile, BrokenFiles_EndInAnErrorOrInSound) {
    makeInput();
    std::mt19937 random(11);
    for (const std::string name : {"x.m4a", "x.opus", "x.wv", "x.mkv", "x.wma"}) {
        encode(name == "x.mkv" ? "-c:a aac -t 0.5" : "-t 0.5", name);
        const std::string bytes = readFile(folder / name);
        const auto attempt = [&](const std::string& broken) {
            folder.write(name, broken);
            try {
                const P<IAudioSource> source = openAv(name);
                EXPECT_LE(readAll(source, 20'000'000).size(), 20'000'000u) << name;
            } catch (const peru::CException&) {
            }
        };
        for (size_t i = 0; i < 20; ++i) attempt(bytes.substr(0, bytes.size() * i / 20));
        for (int i = 0; i < 100; ++i) {
            std::string broken = bytes;
            for (int flips = 0; flips < 4; ++flips)
                broken[random() % (i % 2 ? bytes.size() : 600)] ^= static_cast<char>(1 << random() % 8);
            attempt(broken);
        }
    }
}

TEST_F(AvFile, WrittenWma_HasItsSoundInPlace) {
    for (const SShape& shape : {SShape{}, SShape{48000, 1, 3}, SShape{22050, 2, 1}, SShape{8000, 1, 2}}) {
        for (const int frames : {0, 1, 5000, 60007}) {
            SCOPED_TRACE(std::to_string(shape.rate) + " Hz, " + std::to_string(frames));
            const std::string pcm = makeMusic({shape.rate, shape.channels, 2}, frames);
            const P<IAudioFormat> format = makeFormat(folder / "x.wma", shape);
            ASSERT_TRUE(format);
            format->setAudioQuality(1.0);
            writeAll(format, makeMusic(shape, frames), shape);
            const std::string peer = decodeByPeer("x.wma");
            ASSERT_GE(peer.size(), pcm.size());
            EXPECT_LT(peer.size() - pcm.size(), 2u * 2048 * 2 * shape.channels);
            if (frames < 5000) continue;
            EXPECT_TRUE(peer == readAll(openAv("x.wma")));
            double power = 0.0, difference = 0.0;
            for (size_t i = 4000; i + 1 < pcm.size(); i += 2) {
                int16_t x, y;
                std::memcpy(&x, &pcm[i], 2);
                std::memcpy(&y, &peer[i], 2);
                power += double(x) * x;
                difference += double(x - y) * (x - y);
            }
            EXPECT_LT(difference, power / 5) << "the sound is displaced";
        }
    }
    EXPECT_FALSE(makeFormat(folder / "x.wma", {96000, 2, 2}));
    EXPECT_FALSE(makeFormat(folder / "x.wma", {44100, 6, 2}));
    const P<IAudioFormat> format = makeFormat(folder / "new.wma");
    format->setAudioBitRate(1000, 0, 0);
    EXPECT_THROW(format->open(), peru::CException);
    EXPECT_FALSE(std::filesystem::exists(folder / "new.wma"));
}

} // namespace

} // namespace tests

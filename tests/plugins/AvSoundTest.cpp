// Sound formats that libav reads, compared with another program's decoding.
#include "plugins/AvFixture.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/IFloatSamples.h"
#include "sonora2/media/ISalvage.h"

namespace tests {

namespace {

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

INSTANTIATE_TEST_SUITE_P(Types, AvSound, testing::ValuesIn(kSoundCases), printSound);

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
    for (const auto& [name, options, bytes] :
         {std::tuple{"x.wv", "-c:a wavpack -sample_fmt fltp", 4}, {"x.nut", "-c:a pcm_f64le", 8}}) {
        encode(std::string(options) + " -af volume=3", name); // exceeds full scale
        const P<IAudioSource> source = openAv(name);
        const auto floats = peru::interfaceCast<sonora2::common::IFloatSamples>(source);
        ASSERT_TRUE(floats && floats->canUseFloat(bytes));
        EXPECT_THROW(floats->useFloat(12 - bytes), sonora2::common::CSonoraError);
        const size_t start = readAll(source, 1).size() / 8; // frames
        floats->useFloat(bytes);
        const std::string coder = "f" + std::to_string(8 * bytes) + "le";
        const std::string peer =
            run("ffmpeg -v error -i " + std::string(name) + " -f " + coder + " -c:a pcm_" + coder + " -");
        EXPECT_TRUE(peer.substr(start * 2 * bytes) == readAll(source));
    }
}

// The length in frames lies in boxes of which there are several forms, or in a comment.
TEST_F(AvFile, LengthOfMp4_IsFoundInEveryForm) {
    makeInput();
    const std::string options = "-c:a aac -aac_pns 0 -movflags use_metadata_tags -metadata iTunSMPB=";
    encode(options + "none", "x.m4a");
    const std::string plain = readFile(folder / "x.m4a");
    const auto number = [](uint64_t value, int bytes) {
        std::string text;
        while (bytes-- > 0) text += static_cast<char>(value >> 8 * bytes);
        return text;
    };
    std::string large = plain, open = plain, longTimes = plain;
    const size_t data = plain.find("free") - 4, moov = plain.rfind("moov") - 4;
    large.replace(data, 16, number(1, 4) + "mdat" + number(moov - data, 8));
    open.replace(moov, 4, number(0, 4));
    for (const char* box : {"moov", "trak", "mdia", "mdhd"}) { // 12 bytes more
        const size_t at = plain.find(box, moov) - 2;
        longTimes.replace(at, 2, number(12 + uint8_t(plain[at]) * 256 + uint8_t(plain[at + 1]), 2));
    }
    const size_t times = plain.find("mdhd", moov) + 4;
    longTimes.replace(times, 20,
                      number(1, 1) + number(0, 19) + plain.substr(times + 12, 4) + number(0, 4) +
                          plain.substr(times + 16, 4));
    for (const std::string& file : {plain, large, open, longTimes}) {
        folder.write("x.m4a", file);
        EXPECT_EQ(kFrames * 4u, readAll(openAv("x.m4a")).size());
    }
    encode(options + "' 00000000 00000840 000001CA 000000000000C350'", "x.m4a");
    EXPECT_EQ(50000 * 4u, readAll(openAv("x.m4a")).size());
}

TEST_F(AvFile, ChangingFormat_IsAnErrorOrConverted) {
    makeInput();
    encode("-c:a aac -aac_pns 0", "a.aac");
    run("ffmpeg -v error -i in.wav -c:a aac -ac 1 b.aac -c:a aac -ar 48000 c.aac");
    run("cat a.aac b.aac > x.aac && cat a.aac c.aac > y.aac");
    EXPECT_LE(getDistance16(readAll(openAv("x.aac")), decodeByPeer("x.aac")), 1);
    run("head -c 65000 in.wav | ffmpeg -v error -f s16le -ar 8000 -ac 65 -i - -c:a pcm_s16le x.nut && ln -s "
        "/proc/self/mem x.m4a");
    for (const auto& [name, reason] : {std::pair{"y.aac", "the sample rate changes"},
                                       {"x.nut", "65 channels at 8000 Hz are not supported"},
                                       {"x.m4a", "Input/output error"}})
        EXPECT_NE(std::string::npos, errorOf([&] { readAll(openAv(name)); }).find(reason));
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
    encode("-c:a aac", "x.mka");
    const std::string half = readFile(folder / "x.mka").substr(0, readFile(folder / "x.mka").size() / 2);
    folder.write("x.mka", half);
    EXPECT_NE(std::string::npos, errorOf([&] { readAll(openAv("x.mka")); }).find(" of 1.3"));
    context->setParameter(kSalvageParameterKey, kSalvageParameter, peru::newString("1"));
    readAll(openAv("x.mka"));
    EXPECT_NE(std::string::npos, log->lines.back().find(" of 1.3"));
    folder.write("no.m4a", "this is no sound");
    EXPECT_ANY_THROW(openAv("no.m4a"));
    // A playlist must not make the process read other files.
    folder.write("list.m4a", "#EXTM3U\n#EXT-X-TARGETDURATION:10\n#EXTINF:10,\nx.tta\n#EXT-X-ENDLIST\n");
    EXPECT_ANY_THROW(readAll(openAv("list.m4a")));
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

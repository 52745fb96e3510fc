// MP3 and Ogg Vorbis compared with their reference programs.
#include "plugins/PluginFixture.h"

namespace tests {

namespace {

std::string little(uint32_t value) {
    return {reinterpret_cast<const char*>(&value), 4};
}

class Lossy : public CPluginTest {};

TEST_F(Lossy, Mp3AndOgg_KeepTheNumberOfFrames) {
    for (const char* name : {"x.mp3", "x.ogg"}) {
        for (const SShape& shape : {SShape{}, SShape{8000, 1, 2}, SShape{48000, 2, 3}, SShape{22050, 1, 1}}) {
            for (int frames : {1, 2, 63, 575, 576, 577, 1151, 1152, 1153, 2304, 4097, 30011}) {
                SCOPED_TRACE(std::string(name) + ", " + std::to_string(shape.rate) + " Hz, " +
                             std::to_string(frames) + " frames");
                writeFile(folder / name, makeMusic(shape, frames), shape);
                const SShape delivered{shape.rate, shape.channels, 2};
                EXPECT_EQ(static_cast<size_t>(frames) * delivered.frameBytes(),
                          read(folder / name, delivered).size());
            }
        }
    }
}

struct SSetting {
    double quality; // unset below 0
    int nominal, minimum, maximum;
    const char* command; // the same setting for the codec's own program
    int estimate;        // bytes for 10 s
};

const SSetting kMp3Settings[] = {
    {-1, 0, 0, 0, "-V 2", 281250},
    {1.0, 0, 0, 0, "-V 0", 325000},
    {0.0, 0, 0, 0, "-V 9.999 --resample 44.1", 81250},
    {-1, 192000, 0, 0, "-b 192", 240000},
    {-1, 96000, 96000, 96000, "-b 96 --resample 44.1", 120000},
    {-1, 160000, 128000, 192000, "--abr 160 -b 128 -B 192", 200000},
};
const SSetting kOggSettings[] = {
    {-1, 0, 0, 0, "-q 3", 140000},
    {1.0, 0, 0, 0, "-q 10", 625000},
    {0.0, 0, 0, 0, "-q 0", 80000},
    {-1, 128000, 96000, 160000, "--managed -b 128 -m 96 -M 160", 160000},
};

TEST_F(Lossy, Settings_AreThoseOfTheirOwnProgram) {
    const auto compare = [this](const SSetting& setting, const SShape& shape, const std::string& name,
                                const std::string& command) {
        SCOPED_TRACE(std::string(setting.command) + ", " + std::to_string(shape.bytes) + " bytes");
        const std::string pcm = makeMusic(shape, 100003);
        writeFile(folder / "in.wav", pcm, shape);
        P<IAudioFormat> format = makeFormat(folder / name, shape);
        if (setting.quality >= 0.0) format->setAudioQuality(setting.quality);
        if (setting.nominal > 0) format->setAudioBitRate(setting.nominal, setting.minimum, setting.maximum);
        EXPECT_NEAR(setting.estimate, format->getEstimatedSizeBytes(10.0), 1);
        // Written at once: Vorbis extrapolates what precedes the first block from the first write.
        format->open();
        format->writeAudioChunk(makeChunk(pcm));
        format->close();
        run(command);
        const std::string ours = read(folder / name), peer = decodeByPeer(name);
        EXPECT_EQ(peer.size(), ours.size());
        EXPECT_LE(getDistance16(peer, ours), 1);
    };
    for (const SSetting& setting : kMp3Settings) {
        for (int bytes : {2, 3}) {
            compare(setting, {44100, 2, bytes}, "ours.mp3",
                    "lame --silent " + std::string(setting.command) + " in.wav theirs.mp3");
            // Only metadata in the first frame may differ, such as the name of the preset.
            const std::string a = readFile(folder / "ours.mp3"), b = readFile(folder / "theirs.mp3");
            ASSERT_EQ(b.size(), a.size());
            EXPECT_TRUE(a.substr(2000) == b.substr(2000));
        }
    }
    for (const SSetting& setting : kOggSettings) {
        compare(setting, {}, "ours.ogg",
                "oggenc -Q " + std::string(setting.command) + " in.wav -o theirs.ogg");
        EXPECT_TRUE(read(folder / "theirs.ogg") == read(folder / "ours.ogg")) << setting.command;
    }
}

struct SMp3File {
    const char* name;
    const char* command; // makes x.mp3 from in.wav or from plain.mp3, lame's encoding of it
    bool exact;          // has exactly the length of in.wav
};

TEST_F(Lossy, ForeignMp3_IsReadAsOthersReadIt) {
    const std::string pcm = makeMusic({}, 100003);
    writeFile(folder / "in.wav", pcm);
    run("lame --silent in.wav plain.mp3");
    const SMp3File files[] = {
        {"without a tag", "lame --silent -t in.wav x.mp3", false},
        {"another writer", "ffmpeg -v error -y -i in.wav -b:a 160k x.mp3", true},
        {"no tag, varying", "lame --silent -t -V 4 in.wav x.mp3", false},
        {"low rate", "lame --silent --resample 22.05 -b 56 in.wav x.mp3", false},
        {"a large picture in front",
         "{ printf 'ID3\\003\\000\\000\\000\\100\\000\\000'; head -c 1048576 /dev/zero | tr '\\0' '\\377'; "
         "cat plain.mp3; } > x.mp3",
         true},
        {"other data behind", "{ cat plain.mp3; printf %5000d 0; tail -c 20000 plain.mp3; } > x.mp3", true},
        {"two in one", "cat plain.mp3 plain.mp3 > x.mp3", false},
        {"two with a tag between",
         "{ cat plain.mp3; printf 'ID3\\003\\000\\000\\000\\000\\001\\000'; "
         "head -c 128 /dev/zero; cat plain.mp3; } > x.mp3",
         false},
        {"zeros behind", "{ cat plain.mp3; head -c 300000 /dev/zero; } > x.mp3", true},
        {"zeros between",
         "{ lame --silent -t in.wav -; head -c 300000 /dev/zero; lame --silent -t in.wav -; } "
         "> x.mp3",
         false},
        {"cut", "head -c 20000 plain.mp3 > x.mp3", false},
        {"layer II", "ffmpeg -v error -y -i in.wav -c:a mp2 -f mp2 x.mp3", false},
    };
    for (const SMp3File& file : files) {
        SCOPED_TRACE(file.name);
        run(file.command);
        log->lines.clear();
        const SShape delivered{file.name == std::string("low rate") ? 22050 : 44100, 2, 2};
        const std::string ours = read(folder / "x.mp3", delivered);
        const std::string layer = file.name == std::string("layer II") ? "II" : "III";
        EXPECT_EQ("MPEG audio layer " + layer, codecOf(openSource(folder / "x.mp3", delivered)));
        const std::string theirs = decodeByPeer("x.mp3");
        if (file.exact) {
            EXPECT_EQ(pcm.size(), ours.size());
        } else {
            EXPECT_NEAR(theirs.size(), ours.size(), 2 * 1152 * 4);
        }
        // The first frame after a gap lacks the bits that it refers back to; decoders conceal this
        // differently.
        const bool isGap = file.name == std::string("zeros between");
        const bool isJoined = isGap || file.name == std::string("two with a tag between");
        const size_t first = isJoined ? 90000 * 4 : SIZE_MAX;
        EXPECT_LE(getDistance16(ours.substr(0, first), theirs), 2);
        const auto isDamage = [](const std::string& line) { return line.find("damaged") != line.npos; };
        EXPECT_EQ(isGap ? 1 : 0, std::ranges::count_if(log->lines, isDamage));
    }
}

// Behind sound whose length is stated nowhere; the tags are full of frames.
TEST_F(Lossy, TagsBehindMp3_AreNoSound) {
    writeFile(folder / "in.wav", makeMusic({}, 50000));
    run("lame --silent -t in.wav x.mp3");
    const std::string sound = readFile(folder / "x.mp3"), expected = read(folder / "x.mp3");
    const std::string frames = sound.substr(4000, 3000), id3("\4\0\x10\0\0\x17\x38", 7);
    const auto ape = [](uint32_t flags) {
        return "APETAGEX" + little(2000) + little(3032) + little(1) + little(flags) + little(0) + little(0);
    };
    const std::string tag = "TAG" + frames.substr(0, 125);
    for (const std::string& tags :
         {tag, "TAG+" + frames.substr(0, 223) + tag, frames + ape(0),
          ape(0xA0000000) + frames + ape(0x80000000) + tag, "ID3" + id3 + frames + "3DI" + id3 + tag,
          "LYRICSBEGIN" + frames + "LYRICSEND", "LYRICSBEGIN" + frames + "003011LYRICS200" + tag,
          std::string("x03011LYRICS200"), std::string("LYRICSEND")}) {
        folder.write("x.mp3", sound + tags);
        EXPECT_TRUE(read(folder / "x.mp3") == expected) << tags.substr(0, 4) << tags.size();
    }
}

// Constant 128 kbit/s: 16 bytes are a millisecond.
TEST_F(Lossy, DamagedMp3_IsLocated) {
    writeFile(folder / "in.wav", makeMusic({}, 5 * 44100));
    run("lame --silent -b 128 in.wav plain.mp3");
    const std::string whole = readFile(folder / "plain.mp3");
    const auto path = folder / "x.mp3";
    const std::pair<size_t, size_t> damages[] = {{20000, 5000}, {50000, 500}, {70000, 1}};
    std::string bytes = whole;
    for (const auto& [at, size] : damages) bytes.replace(whole.find("\xFF\xFB", at), size, size, '\x55');
    folder.write("x.mp3", bytes);
    P<IAudioSource> source = openSource(path);
    readAll(source);
    source->skipToTime(0.5);
    readAll(source); // is not reported again
    ASSERT_EQ(4u, log->lines.size());
    EXPECT_NE(std::string::npos, log->lines[0].find("is incomplete"));
    double lost = 0.0;
    for (size_t i = 0; i < 3; ++i) {
        double place = 0.0, seconds = 0.0;
        int skipped = 0;
        const std::string& line = log->lines[i + 1];
        ASSERT_EQ(0u, line.find(path.string() + " is damaged at "));
        std::sscanf(line.c_str() + path.string().size(), " is damaged at %lf seconds: %d bytes, about %lf",
                    &place, &skipped, &seconds);
        EXPECT_NEAR(static_cast<double>(damages[i].first) / 16000, place + lost, 0.08) << line;
        EXPECT_NEAR(static_cast<double>(damages[i].second), skipped, 2 * 418) << line;
        EXPECT_GE(skipped, static_cast<int>(damages[i].second)) << line;
        EXPECT_NEAR(skipped / 16000.0, seconds, 0.001) << line;
        lost += seconds;
    }

    // What the codec leaves out at the end is silence, up to the stated length.
    run("sox -n -r 44100 -c 2 in.wav synth 2 sine 440 && lame --silent -b 128 in.wav plain.mp3");
    const std::string tone = readFile(folder / "plain.mp3").substr(0, 4100);
    int padded = 0;
    for (size_t at = tone.find("\xFF\xFB", 1000); at < 4000; at = tone.find("\xFF\xFB", at + 1)) {
        folder.write("x.mp3", std::string(tone).replace(at, 4, 4, '\x55'));
        source = openSource(path);
        EXPECT_EQ(std::llround(source->getDuration() * 44100) * 4, std::ssize(readAll(source))) << at;
        padded += log->lines.back().find("silence follows the sound") != std::string::npos;
    }
    EXPECT_GE(padded, 1);
}

// Frames of silence in shapes that no encoder at hand writes.
TEST_F(Lossy, RareMpegFrames_AreCounted) {
    const struct {
        const char *name, *header;
        size_t bytes, frames;
    } files[] = {{"layer I.mp1", "\xFF\xFF\xC0", 416, 384}, {"free format.mp2", "\xFF\xFD\0", 600, 1152}};
    for (const auto& file : files) {
        std::string bytes;
        for (int i = 0; i < 100; ++i)
            bytes += std::string(file.header, 3) + std::string(file.bytes - 3, '\0');
        folder.write(file.name, bytes);
        EXPECT_EQ(std::string(100 * file.frames * 4, '\0'), read(folder / file.name)) << file.name;
    }
}

TEST_F(Lossy, Mp3UnderAnotherName_IsRefusedSilently) {
    writeFile(folder / "x.mp3", makeMusic({}, 5000));
    const std::string bytes = readFile(folder / "x.mp3");
    testing::internal::CaptureStderr();
    for (const char* name : {"x.wav", "x.flac", "x.ogg"}) {
        folder.write(name, bytes.substr(0, 1500));
        EXPECT_FALSE(openSource(folder / name));
    }
    EXPECT_EQ("", testing::internal::GetCapturedStderr());
}

// Their length is counted.
TEST_F(CPluginTest, ReopenedFile_IsTheSameUntilTheFileChanges) {
    for (const auto& path : {folder / "x.mp3", folder / "x.flac"}) {
        SCOPED_TRACE(path);
        const auto write = [&](int frames) {
            writeFile(path, makeMusic({}, frames));
            if (path.extension() == ".flac") // without a length
                folder.write("x.flac", readFile(path).replace(22, 4, 4, '\0'));
        };
        write(400000);
        P<IAudioSource> source = openSource(path);
        const std::string all = readAll(source);
        for (double time : {0.0, 5.0, 1.5}) {
            source->close();
            source->open();
            source->skipToTime(time);
            EXPECT_TRUE(readAll(source) == all.substr(static_cast<size_t>(time * 44100) * 4)) << time;
        }
        source->close();
        write(5000);
        source->open();
        EXPECT_EQ(5000u * 4, readAll(source).size());
        EXPECT_DOUBLE_EQ(5000 / 44100.0, source->getDuration());
    }
}

TEST_F(Lossy, EverySpeakerOfOgg_StaysInItsPlace) {
    for (int channels = 1; channels <= 8; ++channels) {
        SCOPED_TRACE(channels);
        const SShape shape{44100, channels, 2};
        // Each channel is audible in a different section.
        const int second = 8820;
        std::string pcm(static_cast<size_t>(second) * channels * shape.frameBytes(), '\0');
        for (int i = 0; i < second * channels; ++i) {
            const int16_t value = static_cast<int16_t>(12000 * std::sin(i * 0.01));
            std::memcpy(&pcm[(static_cast<size_t>(i) * channels + i / second) * 2], &value, 2);
        }
        const auto path = folder / "x.ogg";
        P<IAudioFormat> format = makeFormat(path, shape);
        format->setAudioQuality(0.8);
        writeAll(format, pcm, shape);
        const std::string ours = read(path, shape);
        ASSERT_EQ(pcm.size(), ours.size());
        EXPECT_LT(getDistance16(pcm, ours), 6000);
        // The peer delivers channels in the order of WAV.
        EXPECT_LE(getDistance16(decodeByPeer("x.ogg"), ours), 2);
    }
}

TEST_F(Lossy, ChainedOgg_IsOneRun) {
    const std::string one = makeMusic({}, 50003);
    const SShape mono{44100, 1, 2};
    writeFile(folder / "a.ogg", one);
    writeFile(folder / "b.ogg", one.substr(0, 7001 * 4));
    writeFile(folder / "c.ogg", makeMusic(mono, 3000), mono);
    const std::string a = readFile(folder / "a.ogg"), b = readFile(folder / "b.ogg");
    writeFile(folder / "d.ogg", one); // each stream of a chain has its own serial number
    const auto path = folder.write("x.ogg", a + b + readFile(folder / "d.ogg"));
    P<IAudioSource> source = openSource(path);
    ASSERT_TRUE(source);
    const std::string all = readAll(source);
    ASSERT_EQ((50003u * 2 + 7001) * 4, all.size());
    EXPECT_TRUE(all.substr(57004 * 4) == read(folder / "d.ogg"));
    for (int frame : {49999, 50003, 50010, 57003, 57004, 100000}) {
        source->skipToTime(frame / 44100.0);
        EXPECT_TRUE(readAll(source) == all.substr(static_cast<size_t>(frame) * 4)) << frame;
    }
    const SShape slow{22050, 2, 2};
    writeFile(folder / "e.ogg", makeMusic(slow, 3000), slow);
    for (const char* other : {"c.ogg", "e.ogg"}) {
        folder.write("y.ogg", a + readFile(folder / other));
        EXPECT_FALSE(openSource(folder / "y.ogg")) << "a chain of two formats";
    }
}

} // namespace

} // namespace tests

#include "HostSupport.h"
#include "host/Wav.h"
#include "support/BadHandles.h"
#include "support/ScriptedDevice.h"

#include <atomic>
#include <cstring>
#include <fcntl.h>
#include <fstream>
#include <random>
#include <sys/file.h>
#include <sys/stat.h>
#include <thread>
#include <unistd.h>

using namespace tests;

extern "C" int32_t cReadShortRecord(TONEWRIGHT_Handle source, int32_t* rate);

namespace {

class Host : public CHostTest {
protected:
    int32_t encode(TONEWRIGHT_Handle source, const std::filesystem::path& target, int rate, int channels,
                   int bytes) {
        const CHandle format(
            TONEWRIGHT_CreateAudioFormatFromURI(uriOf(target).c_str(), rate, channels, bytes, 0.0, 0, 0, 0));
        const CHandle encoder(TONEWRIGHT_CreateAudioEncoder(source, format));
        return TONEWRIGHT_AudioEncoder_Encode(encoder);
    }
};

} // namespace

TEST(HostText, PathsAndTextsComeBack) {
    std::mt19937 random(7);
    for (int i = 0; i < 2000; ++i) {
        std::string path = "/";
        for (size_t length = random() % 12; length > 0; --length)
            path += static_cast<char>(1 + random() % 255);
        const Owned<char16_t> uri(TONEWRIGHT_Host_PathToURI(path.c_str()));
        ASSERT_TRUE(uri);
        const Owned<char> back(TONEWRIGHT_Host_URIToPath(uri.get()));
        ASSERT_TRUE(back) << testing::PrintToString(path);
        ASSERT_EQ(std::filesystem::path(path).lexically_normal(),
                  std::filesystem::path(back.get()).lexically_normal());

        std::u16string text;
        for (size_t length = random() % 8; length > 0; --length) {
            constexpr char32_t kEdges[] = {0x7F,   0x80,   0x7FF,   0x800,   0xD7FF,
                                           0xE000, 0xFFFF, 0x10000, 0x10FFFF};
            const char32_t any = random() % 3 ? 1 + random() % 0xD7FF : 0x10000 + random() % 0x100000;
            const char32_t character = random() % 9 ? any : kEdges[random() % 9];
            if (character >= 0x10000) text += static_cast<char16_t>(0xD7C0 + (character >> 10));
            text += static_cast<char16_t>(character >= 0x10000 ? 0xDC00 + (character & 0x3FF) : character);
        }
        const Owned<char> utf8(TONEWRIGHT_Host_ToUTF8(text.c_str()));
        ASSERT_EQ(text, Owned<char16_t>(TONEWRIGHT_Host_ToUTF16(utf8.get())).get());
    }
    EXPECT_STREQ(Owned<char>(TONEWRIGHT_Host_ToUTF8(u"a\xD800"
                                                    u"b\xDC00"))
                     .get(),
                 "a\xEF\xBF\xBD"
                 "b\xEF\xBF\xBD");
    for (const char* bad :
         {"\x80", "a\xC0\x80", "\xC3", "\xED\xA0\x80", "\xE0\x80\x80", "\xF4\x90\x80\x80", "\xFF"})
        EXPECT_EQ(TONEWRIGHT_Host_ToUTF16(bad), nullptr) << testing::PrintToString(std::string(bad));
    EXPECT_FALSE(TONEWRIGHT_Host_ToUTF8(nullptr) || TONEWRIGHT_Host_URIToPath(nullptr));
    EXPECT_FALSE(TONEWRIGHT_Host_ToUTF16(nullptr) || TONEWRIGHT_Host_PathToURI(nullptr));
    for (const char16_t* other : {u"http://host/x", u"relative/x", u"file://otherhost/x"})
        EXPECT_EQ(TONEWRIGHT_Host_URIToPath(other), nullptr);
    const std::string relative = Owned<char>(TONEWRIGHT_Host_URIToPath(uriOf("x y%20").c_str())).get();
    EXPECT_EQ(relative, (std::filesystem::current_path() / "x y%20").string());
}

TEST_F(Host, LogCallbackHearsOfFailuresUntilItIsRemoved) {
    struct SHeard {
        std::string text;
        int count = 0;
        int lowest = 99;
    } heard;
    const auto listen = [](const TONEWRIGHT_LogMessage* message, void* user) {
        auto& entry = *static_cast<SHeard*>(user);
        entry.text += std::string(message->component) + "|" + message->text + "\n";
        ++entry.count;
        entry.lowest = std::min<int>(entry.lowest, message->level);
        TONEWRIGHT_CreateAudioSourceFromURI(u"nonsense://", 44100, 2, 2, 0); // must not call this again
    };
    EXPECT_EQ(TONEWRIGHT_Host_CreateLog(0, nullptr, nullptr), nullptr);
    {
        const CHandle log(TONEWRIGHT_Host_CreateLog(TONEWRIGHT_LOG_ERROR, listen, &heard));
        TONEWRIGHT_AddProxyLogManager(log);
        EXPECT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK); // has a line of its own, below an error
        for (int i = 0; i < 2; ++i) {
            heard.text.clear();
            EXPECT_FALSE(TONEWRIGHT_CreateAudioSourceFromURI(uriOf(folder / "no.wav").c_str(), 0, 2, 2, 0));
        }
        TONEWRIGHT_RemoveProxyLogManager(log);
    }
    EXPECT_NE(heard.text.find("not all sourceparameter fields are valid"), std::string::npos) << heard.text;
    EXPECT_EQ(heard.lowest, TONEWRIGHT_LOG_ERROR);
    const int count = heard.count;
    EXPECT_EQ(TONEWRIGHT_CreateAudioSourceFromURI(uriOf(folder / "no.wav").c_str(), 0, 2, 2, 0), nullptr);
    EXPECT_EQ(heard.count, count);
}

TEST_F(Host, FailuresAreRememberedForEachThread) {
    TONEWRIGHT_Host_ClearLastFailure();
    EXPECT_EQ(TONEWRIGHT_Host_GetLastFailure(nullptr), 0);
    EXPECT_STREQ(lastFailure().message, "");

    folder.write("bad.flac", "no sound");
    const struct {
        std::string name;
        const char* reason;
    } cases[] = {{"missing.wav", "No such file"},
                 {"bad.flac", "bad.flac"},
                 {"x.unknown", "No plug-in reads .unknown files"},
                 {"noextension", "No plug-in reads files without an extension"}};
    for (const auto& each : cases) {
        EXPECT_EQ(TONEWRIGHT_Host_OpenMedia(uriOf(folder / each.name).c_str(), nullptr), nullptr);
        const TONEWRIGHT_Failure failure = lastFailure();
        EXPECT_NE(std::string(failure.message).find(each.reason), std::string::npos) << failure.message;
        EXPECT_NE(std::string(failure.kind).find("Error"), std::string::npos) << failure.kind;
        EXPECT_STRNE(failure.title, "");
    }
    EXPECT_EQ(TONEWRIGHT_Host_GetLastFailure(nullptr), 1);
    std::thread([] { EXPECT_EQ(TONEWRIGHT_Host_GetLastFailure(nullptr), 0); }).join();
    EXPECT_EQ(TONEWRIGHT_Host_GetMediaInfo(nullptr, nullptr), 0);
    EXPECT_STREQ(lastFailure().message, "The handle is not an audio source");
    TONEWRIGHT_Host_ClearLastFailure();
    EXPECT_EQ(TONEWRIGHT_Host_GetLastFailure(nullptr), 0);
}

// Checked against soxi and the encoders' own programs.
TEST_F(Host, BadHandlesAreRefused) {
    const CHandle log(TONEWRIGHT_Host_CreateLog(
        0, [](const TONEWRIGHT_LogMessage*, void*) {}, nullptr));
    expectRefused(log, -1, TONEWRIGHT_Host_ApplyTagChange, TONEWRIGHT_Host_ReadFrames,
                  TONEWRIGHT_Host_GetPlayerSourceIndex, TONEWRIGHT_Host_QueryCDDB);
    expectRefused(
        log, static_cast<const void*>(nullptr), TONEWRIGHT_Host_TakeWarnings, TONEWRIGHT_Host_GetOutputPath,
        TONEWRIGHT_Host_CreateReader, TONEWRIGHT_Host_MeasureLoudness, TONEWRIGHT_Host_CreateGainSource,
        TONEWRIGHT_Host_GetDiscProject, TONEWRIGHT_Host_GetDiscProjectURI, TONEWRIGHT_Host_ReadCDDB);
    expectRefused(
        log, 0, TONEWRIGHT_Host_SetSourceFormat, TONEWRIGHT_Host_SetSalvage,
        TONEWRIGHT_Host_SetClippingPrevention, TONEWRIGHT_Host_CommitOutput, TONEWRIGHT_Host_GetTagEntryCount,
        TONEWRIGHT_Host_GetTagEntry, TONEWRIGHT_Host_GetTagPictureCount, TONEWRIGHT_Host_GetTagPicture,
        TONEWRIGHT_Host_ChangeTagField, TONEWRIGHT_Host_RemoveTagPictures, TONEWRIGHT_Host_AddTagPicture,
        TONEWRIGHT_Host_Seek, TONEWRIGHT_Host_GetDeviceCount, TONEWRIGHT_Host_GetDevice,
        TONEWRIGHT_Host_SetEncoderProgress, TONEWRIGHT_Host_SetPlayerProgress,
        TONEWRIGHT_Host_SetRecordingProgress, TONEWRIGHT_Host_SetRecordingLevels, TONEWRIGHT_Host_SeekPlayer,
        TONEWRIGHT_Host_SetPlayerVolume, TONEWRIGHT_Host_SetPlayerDevice, TONEWRIGHT_Host_EnqueueSource,
        TONEWRIGHT_Host_GetMediaInfo, TONEWRIGHT_Host_GetCDDBCandidateCount, TONEWRIGHT_Host_GetCDDBCandidate,
        TONEWRIGHT_Host_GetCDDBRecord, TONEWRIGHT_Host_GetCDDBTrack, TONEWRIGHT_Host_RunDownload);
}

TEST_F(Host, MediaInfoIsTheFilesOwn) {
    const struct {
        const char* name;
        int rate, channels, bits;
        const char* codec;
        const char* plugin;
    } cases[] = {{"a.wav", 96000, 1, 24, "PCM", "sonora2_wav"},
                 {"b.flac", 48000, 6, 24, "FLAC", "sonora2_flac"},
                 {"c.ogg", 22050, 2, 16, "Vorbis", "sonora2_vorbis"},
                 {"d.mp3", 32000, 2, 16, "MPEG", "sonora2_decmpa"},
                 {"e.aiff", 11025, 2, 8, "PCM", "sonora2_wav"}};
    for (const auto& each : cases) {
        const std::string file = folder / each.name;
        ASSERT_EQ(run({"sox", "-n", "-r", std::to_string(each.rate), "-c", std::to_string(each.channels),
                       "-b", std::to_string(each.bits), file, "synth", "1.5", "sine", "300"})
                      .exitCode,
                  0);
        auto info = makeRecord<TONEWRIGHT_MediaInfo>();
        const CHandle source(TONEWRIGHT_Host_OpenMedia(uriOf(file).c_str(), &info));
        ASSERT_TRUE(source) << lastFailure().message;
        EXPECT_EQ(TONEWRIGHT_AudioSource_IsOpened(source), 1);
        EXPECT_EQ(info.sampleRate, each.rate) << each.name;
        EXPECT_EQ(info.channelCount, each.channels) << each.name;
        EXPECT_EQ(info.bytesPerSample * 8, each.bits) << each.name;
        EXPECT_NEAR(info.duration, 1.5, 0.1) << each.name;
        EXPECT_NEAR(static_cast<double>(info.bitRate), std::filesystem::file_size(file) * 8 / info.duration,
                    8)
            << each.name;
        EXPECT_EQ(std::string(info.codec).substr(0, std::string(each.codec).size()), each.codec) << each.name;
        EXPECT_STREQ(info.plugin, each.plugin);

        // The file's own format, whatever the source delivers; a closed source is closed again afterwards.
        const CHandle other(
            TONEWRIGHT_CreateAudioSourceFromURI(uriOf(file).c_str(), 44100, each.channels, 2, 0));
        auto again = makeRecord<TONEWRIGHT_MediaInfo>();
        EXPECT_EQ(TONEWRIGHT_Host_GetMediaInfo(other, &again), 1);
        EXPECT_EQ(std::memcmp(&again, &info, sizeof info), 0) << each.name;
        EXPECT_EQ(TONEWRIGHT_AudioSource_IsOpened(other), 0);
        int32_t rate = 0;
        EXPECT_EQ(cReadShortRecord(other, &rate), 1);
        EXPECT_EQ(rate, each.rate);
    }
}

TEST_F(Host, FloatBeyondFullScaleStaysOrIsScaled) {
    const std::string file = folder / "in.wav";
    ASSERT_EQ(run({"ffmpeg", "-v", "error", "-f", "lavfi", "-i", "aevalsrc=4*sin(440*2*PI*t):s=8000:d=1",
                   "-c:a", "pcm_f32le", file})
                  .exitCode,
              0);
    for (const auto& [target, prevent, warning] :
         {std::tuple{"a.w64", 0, ""}, {"b.flac", 0, "clipped"}, {"c.flac", 1, "reduced by 12.0 dB"}}) {
        auto info = makeRecord<TONEWRIGHT_MediaInfo>();
        const CHandle source(TONEWRIGHT_Host_OpenMedia(uriOf(file).c_str(), &info));
        EXPECT_EQ(TONEWRIGHT_Host_SetClippingPrevention(source, prevent), 1);
        EXPECT_EQ(encode(source, folder / target, 8000, 1, info.bytesPerSample), TONEWRIGHT_OK);
        const Owned<char> lines(TONEWRIGHT_Host_TakeWarnings(source));
        EXPECT_NE(std::string(lines ? lines.get() : "").find(warning), std::string::npos) << lines.get();
        EXPECT_EQ(!lines, !*warning) << target;
        const CHandle written(TONEWRIGHT_Host_OpenMedia(uriOf(folder / target).c_str(), &info));
        EXPECT_EQ(std::string(info.codec) == "PCM float 32 bit", !*warning) << info.codec;
    }
}

TEST_F(Host, CapabilitiesAreWhatTheEncoderTakes) {
    const struct {
        const char* name;
        int lowest, highest, channels;
        uint32_t widths; // bit n - 1: n bytes
        uint32_t settings;
    } cases[] = {{"x.mp3", 8000, 48000, 2, 0x2, TONEWRIGHT_SETTING_QUALITY | TONEWRIGHT_SETTING_BIT_RATE},
                 {"x.flac", 8000, 384000, 8, 0x7, TONEWRIGHT_SETTING_QUALITY | TONEWRIGHT_SETTING_WIDTH},
                 {"x.wav", 8000, 384000, 32, 0xF, TONEWRIGHT_SETTING_WIDTH}};
    for (const auto& each : cases) {
        const std::u16string uri = uriOf(folder / each.name);
        auto can = makeRecord<TONEWRIGHT_Capabilities>();
        ASSERT_EQ(TONEWRIGHT_Host_GetCapabilities(uri.c_str(), &can), 1);
        ASSERT_GT(can.rateCount, 0);
        EXPECT_EQ(can.rates[0], each.lowest) << each.name;
        EXPECT_EQ(can.rates[can.rateCount - 1], each.highest) << each.name;
        EXPECT_EQ(can.channelCounts >> (each.channels - 1), 1u) << each.name;
        EXPECT_EQ(can.widths & each.widths, each.widths) << each.name << can.widths;
        EXPECT_EQ(can.settings, each.settings) << each.name;
        EXPECT_EQ(TONEWRIGHT_Host_CanWrite(uri.c_str(), each.highest, 2, 2), 1) << each.name;
        if (each.channels < 32) {
            EXPECT_EQ(TONEWRIGHT_Host_CanWrite(uri.c_str(), 44100, each.channels + 1, 2), 0) << each.name;
        }
    }
    EXPECT_EQ(TONEWRIGHT_Host_CanWrite(uriOf(folder / "x.mp3").c_str(), 96000, 2, 2), 0);
    auto can = makeRecord<TONEWRIGHT_Capabilities>();
    EXPECT_EQ(TONEWRIGHT_Host_GetCapabilities(uriOf(folder / "x.xyz").c_str(), &can), 0);
    EXPECT_STREQ(lastFailure().message, "No plug-in writes .xyz files");
    EXPECT_TRUE(std::filesystem::is_empty(folder.path()));
}

TEST_F(Host, CapabilitiesOfABoxedPluginTakeOneProcess) {
    std::filesystem::create_directory(folder / "companions");
    const auto program =
        folder.write("companions/sonora2_slave", "#!/bin/sh\necho >> '" + (folder / "starts").string() +
                                                     "'\nexec " SLAVE_PROGRAM " \"$@\"\n");
    std::filesystem::permissions(program, std::filesystem::perms(0700));
    const CEnvironment companions("TONEWRIGHT_COMPANION_PATH", program.parent_path().string());
    const std::u16string uri = uriOf(folder / "x.wma");
    auto boxed = makeRecord<TONEWRIGHT_Capabilities>(), plain = boxed;
    ASSERT_EQ(TONEWRIGHT_Host_GetCapabilities(uri.c_str(), &boxed), 1);
    EXPECT_EQ(std::filesystem::file_size(folder / "starts"), 1u);
    EXPECT_EQ(TONEWRIGHT_Host_CanWrite(uri.c_str(), 44100, 2, 2), 1); // is known
    EXPECT_EQ(TONEWRIGHT_Host_CanWrite(uri.c_str(), 44100, 9, 2), 0);
    EXPECT_EQ(std::filesystem::file_size(folder / "starts"), 1u);
    TONEWRIGHT_DeInitAll();
    const CEnvironment none("TONEWRIGHT_BOXED", "none");
    ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK);
    ASSERT_EQ(TONEWRIGHT_Host_GetCapabilities(uri.c_str(), &plain), 1);
    EXPECT_EQ(std::memcmp(&boxed, &plain, sizeof plain), 0);
}

TEST_F(Host, PluginIsTheOneThatIsAskedFirst) {
    const struct {
        const char16_t* extension;
        int32_t type;
        const char* plugin; // empty: none
        int32_t isBoxed = 0;
    } cases[] = {{u"flac", TONEWRIGHT_AUDIO_SOURCE, "sonora2_flac"},
                 {u"WMA", TONEWRIGHT_AUDIO_FORMAT, "sonora2_wmf", 1},
                 {u"m4a", TONEWRIGHT_AUDIO_SOURCE, "sonora2_dsgraph", 1},
                 {u"m4a", TONEWRIGHT_AUDIO_FORMAT, ""},
                 {u"", TONEWRIGHT_AUDIO_SOURCE, ""}};
    for (const auto& each : cases) {
        auto info = makeRecord<TONEWRIGHT_PluginInfo>();
        EXPECT_EQ(TONEWRIGHT_Host_GetPlugin(each.extension, each.type, &info), *each.plugin ? 1 : 0);
        EXPECT_STREQ(info.plugin, each.plugin);
        EXPECT_EQ(info.isBoxed, each.isBoxed) << each.plugin;
    }
    EXPECT_STREQ(lastFailure().message, "No plug-in reads files without an extension");
    const CHandle all(TONEWRIGHT_getValidCodecExtensions(TONEWRIGHT_AUDIO_FORMAT));
    const CHandle first(TONEWRIGHT_getExtension(all, 0));
    EXPECT_EQ(std::u16string(TONEWRIGHT_Host_GetText(first), TONEWRIGHT_Host_GetTextLength(first)), u"flac");
    EXPECT_EQ(TONEWRIGHT_Host_GetPlugin(nullptr, TONEWRIGHT_AUDIO_SOURCE, nullptr), 0);
}

TEST_F(Host, CallbackSourceDeliversEverySample) {
    struct SHostData {
        std::string pcm = makeNoise(44100, 2, 16, 30011).samples;
        size_t position = 0;
        int released = 0;
        int failAt = -1; // frame
    } data;
    TONEWRIGHT_SourceCallbacks callbacks = {sizeof callbacks, nullptr, nullptr, nullptr};
    callbacks.read = [](void* user, void* samples, int64_t frames) -> int64_t {
        auto& host = *static_cast<SHostData*>(user);
        if (host.failAt >= 0 && host.position / 4 >= static_cast<size_t>(host.failAt)) return -1;
        const size_t size =
            std::min<size_t>(static_cast<size_t>(frames) * 4, host.pcm.size() - host.position);
        const size_t some = size > 400 ? size / 4 / 3 * 4 : size; // fewer than requested is allowed
        std::memcpy(samples, host.pcm.data() + host.position, some);
        host.position += some;
        return static_cast<int64_t>(some / 4);
    };
    callbacks.release = [](void* user) { ++static_cast<SHostData*>(user)->released; };

    EXPECT_EQ(TONEWRIGHT_Host_CreateSourceFromCallbacks(0, 2, 2, -1, &callbacks, &data), nullptr);
    EXPECT_EQ(data.released, 0);
    for (const int64_t length : {INT64_C(30011), INT64_C(-1)}) {
        data.position = 0;
        const CHandle source(
            TONEWRIGHT_Host_CreateSourceFromCallbacks(44100, 2, 2, length, &callbacks, &data));
        ASSERT_EQ(encode(source, folder / "out.wav", 44100, 2, 2), TONEWRIGHT_OK) << lastFailure().message;
        EXPECT_EQ(TONEWRIGHT_AudioSource_Open(source), TONEWRIGHT_AUDIO_FAILED); // it cannot restart
        EXPECT_TRUE(readFile(folder / "out.wav").ends_with(data.pcm));
    }
    EXPECT_EQ(data.released, 2);
    data.position = 0;
    data.failAt = 15000;
    const CHandle source(TONEWRIGHT_Host_CreateSourceFromCallbacks(44100, 2, 2, 30011, &callbacks, &data));
    EXPECT_EQ(encode(source, folder / "bad.flac", 44100, 2, 2), TONEWRIGHT_ENCODER_RUN_FAILED);
}

TEST_F(Host, ReaderSeeksToTheFrame) {
    const SSound sound = makeNoise(8000, 1, 24, 20000);
    const std::string& pcm = sound.samples;
    folder.write("in.wav", toWav(sound));
    const CHandle memory(TONEWRIGHT_Host_CreateSourceFromMemory(8000, 1, 3, pcm.data(), 20000));
    const CHandle file(TONEWRIGHT_Host_OpenMedia(uriOf(folder / "in.wav").c_str(), nullptr));
    EXPECT_DOUBLE_EQ(TONEWRIGHT_AudioSource_GetDuration(memory), 2.5);
    for (const TONEWRIGHT_Handle source : {memory.get(), file.get()}) {
        const CHandle reader(TONEWRIGHT_Host_CreateReader(source));
        std::string all(60000, '\0');
        ASSERT_EQ(TONEWRIGHT_Host_ReadFrames(reader, all.data(), 20000), 20000);
        EXPECT_TRUE(all == pcm);
        EXPECT_EQ(TONEWRIGHT_Host_ReadFrames(reader, all.data(), 1), 0);
        EXPECT_EQ(TONEWRIGHT_Host_ReadFrames(reader, nullptr, 0), 0);
        std::mt19937 random(3);
        for (int i = 0; i < 50; ++i) {
            const size_t ends[] = {0, 19999, 20000};
            const size_t frame = i < 3 ? ends[i] : random() % 20000, count = 1 + random() % 9000;
            ASSERT_EQ(TONEWRIGHT_Host_Seek(reader, static_cast<double>(frame) / 8000), 1)
                << lastFailure().message;
            const size_t expected = std::min<size_t>(count, 20000 - frame);
            ASSERT_EQ(TONEWRIGHT_Host_ReadFrames(reader, all.data(), static_cast<int64_t>(count)),
                      static_cast<int64_t>(expected));
            ASSERT_TRUE(all.compare(0, expected * 3, pcm, frame * 3, expected * 3) == 0)
                << frame << " " << count;
        }
        for (const double invalid : {-1.0, std::nan("")}) EXPECT_EQ(TONEWRIGHT_Host_Seek(reader, invalid), 0);
        EXPECT_EQ(TONEWRIGHT_Host_ReadFrames(reader, nullptr, 5), -1);
    }
}

TEST_F(Host, ArrangementNamesMediaBesideIt) {
    const auto read = [&](const std::string& xml) {
        folder.write("a.xml", xml);
        const Owned<char16_t> text(TONEWRIGHT_Host_ReadArrangement((folder / "a.xml").c_str()));
        return text ? std::string(Owned<char>(TONEWRIGHT_Host_ToUTF8(text.get())).get()) : std::string();
    };
    const std::string xml = read("<A><Tracks><Track><Uri>x%20y.wav</Uri></Track>"
                                 "<Track><Uri>file:///z.wav</Uri></Track></Tracks></A>");
    EXPECT_NE(xml.find("<Uri>file://" + folder.path().string() + "/x%20y.wav</Uri>"), std::string::npos)
        << xml;
    EXPECT_NE(xml.find("<Uri>file:///z.wav</Uri>"), std::string::npos) << xml;
    const struct {
        const char* xml;
        const char* reason;
    } bad[] = {{"<A><Tracks/></A>", "no tracks"},
               {"<A><Tracks><Track/></Tracks></A>", "Track 1 has no Uri"},
               {"no xml", ""}};
    for (const auto& each : bad) {
        EXPECT_EQ(read(each.xml), "");
        EXPECT_NE(std::string(lastFailure().message).find(each.reason), std::string::npos)
            << lastFailure().message;
    }
}

TEST_F(Host, EncoderAnswersDecideAboutTheFile) {
    const std::string pcm(44100 * 4 * 3, '\1');
    struct SAnswer {
        int32_t answer;
        double last = -1;
    };
    const auto answer = [](double fraction, void* user) -> int32_t {
        auto& wanted = *static_cast<SAnswer*>(user);
        wanted.last = fraction;
        return fraction < 0.5 ? TONEWRIGHT_CONTINUE : wanted.answer;
    };
    for (const int32_t wanted : {TONEWRIGHT_CONTINUE, TONEWRIGHT_STOP, TONEWRIGHT_DISCARD}) {
        const std::filesystem::path file = folder.write("out.wav", "old");
        const CHandle source(TONEWRIGHT_Host_CreateSourceFromMemory(44100, 2, 2, pcm.data(), 44100 * 3));
        const CHandle format(
            TONEWRIGHT_CreateAudioFormatFromURI(uriOf(file).c_str(), 44100, 2, 2, 0.0, 0, 0, 0));
        const CHandle encoder(TONEWRIGHT_CreateAudioEncoder(source, format));
        SAnswer state{wanted};
        ASSERT_EQ(TONEWRIGHT_Host_SetEncoderProgress(encoder, answer, &state), 1);
        EXPECT_EQ(TONEWRIGHT_AudioEncoder_Encode(encoder), TONEWRIGHT_OK);
        EXPECT_EQ(state.last == 1.0, wanted == TONEWRIGHT_CONTINUE);
        EXPECT_EQ(readFile(file) == "old", wanted == TONEWRIGHT_DISCARD);
        const double part = wanted == TONEWRIGHT_CONTINUE ? 1.0 : wanted == TONEWRIGHT_STOP ? 0.5 : 0.0;
        EXPECT_NEAR(static_cast<double>(readFile(file).size()), part * 44100 * 12, part == 1.0 ? 100 : 50000);
    }
    EXPECT_EQ(TONEWRIGHT_Host_SetEncoderProgress(nullptr, answer, nullptr), 0);
}

TEST_F(Host, OutputAppearsCompleteOrNotAtAll) {
    const auto create = [&](const std::string& path, int32_t flags = 0) {
        return TONEWRIGHT_Host_CreateOutput(path.c_str(), ".part7", flags);
    };
    const auto write = [](TONEWRIGHT_Handle output, const std::string& text) {
        std::ofstream(TONEWRIGHT_Host_GetOutputPath(output), std::ios::binary) << text;
    };
    const std::string file = folder / "x.wav";
    std::filesystem::create_directory(folder / "real");
    std::filesystem::create_directory_symlink("real", folder / "linked");
    {
        const CHandle output(create(file));
        write(output, "new");
        EXPECT_FALSE(std::filesystem::exists(file));
    }
    EXPECT_EQ(countEntries(folder.path()), 2u); // no temporary files left
    {
        const CHandle output(create(folder / "real/a.wav"));
        EXPECT_EQ(create(folder / "linked/a.wav", TONEWRIGHT_OUTPUT_REPLACE), nullptr); // the same file
        write(output, "first");
        EXPECT_EQ(TONEWRIGHT_Host_CommitOutput(output), 1);
    }
    EXPECT_EQ(readFile(folder / "real/a.wav"), "first");

    // A private file stays private, even while its replacement is written, and a link stays a link.
    std::filesystem::permissions(folder / "real/a.wav", std::filesystem::perms(0600));
    std::filesystem::create_symlink("real/a.wav", folder / "link.wav");
    {
        const CHandle output(create(folder / "link.wav", TONEWRIGHT_OUTPUT_REPLACE));
        write(output, "second");
        EXPECT_EQ(std::filesystem::status(TONEWRIGHT_Host_GetOutputPath(output)).permissions(),
                  std::filesystem::perms(0600));
        EXPECT_EQ(TONEWRIGHT_Host_CommitOutput(output), 1);
    }
    EXPECT_TRUE(std::filesystem::is_symlink(folder / "link.wav"));
    EXPECT_EQ(readFile(folder / "real/a.wav"), "second");
    EXPECT_EQ(std::filesystem::status(folder / "real/a.wav").permissions(), std::filesystem::perms(0600));

    // A target created in the meantime, a dangling link, and the files of other jobs.
    {
        const CHandle output(create(file));
        write(output, "late");
        folder.write("x.wav", "other");
        EXPECT_EQ(TONEWRIGHT_Host_CommitOutput(output), 0);
        EXPECT_EQ(readFile(file), "other");
    }
    std::filesystem::create_symlink("not-there.wav", folder / "dangling.wav");
    {
        const CHandle output(create(folder / "dangling.wav"));
        write(output, "there");
        EXPECT_EQ(TONEWRIGHT_Host_CommitOutput(output), 1);
    }
    EXPECT_EQ(readFile(folder / "not-there.wav"), "there");
    folder.write("y.wav.part7", "left by a process that was killed");
    {
        const CHandle output(create(folder / "y.wav", TONEWRIGHT_OUTPUT_REPLACE));
        EXPECT_EQ(readFile(TONEWRIGHT_Host_GetOutputPath(output)), "");
        std::filesystem::remove(folder / "y.wav.part7");
        EXPECT_EQ(TONEWRIGHT_Host_CommitOutput(output), 0);
    }
}

TEST_F(Host, OutputSaysWhyATargetCannotBeWritten) {
    const std::string base = folder.path().string() + "/", extension(249, 'y');
    for (const char* name : {"file", "left.part7", "busy.part7"}) folder.write(name, "somebody's");
    for (const char* name : {"real", "dir.part7"}) std::filesystem::create_directory(folder / name);
    for (const char* name : {"loop", "link.part7"}) std::filesystem::create_symlink("loop", folder / name);
    ASSERT_EQ(::mkfifo((folder / "fifo").c_str(), 0600), 0);
    const int locked = ::open((folder / "busy.part7").c_str(), O_RDONLY);
    ASSERT_EQ(::flock(locked, LOCK_EX), 0);
    const std::pair<std::string, std::string> cases[] = {
        {"real", base + "real cannot be written: Is a directory"},
        {"fifo", base + "fifo cannot be written: It is not a regular file"},
        {"no/x", "The folder " + base + "no does not exist"},
        {"file/x", base + "file is not a folder"},
        {"loop/x", "The folder " + base + "loop cannot be used: Too many levels of symbolic links"},
        {"file", base + "file exists"},
        {"left", base + "left.part7 was left by an earlier run"},
        {"x." + extension, base + "x." + extension + " cannot be written: The name is too long"},
        {"dir", base + "dir.part7 cannot be replaced: It is not a regular file"},
        {"link", base + "link.part7 cannot be replaced: Too many levels of symbolic links"},
        {"busy", "Another program is already writing to " + base + "busy"}};
    for (const auto& [name, message] : cases) {
        const int32_t flags = name == "file" || name == "left" ? 0 : TONEWRIGHT_OUTPUT_REPLACE;
        EXPECT_FALSE(TONEWRIGHT_Host_CreateOutput((folder / name).c_str(), ".part7", flags)) << name;
        EXPECT_EQ(lastFailure().message, message);
    }
    for (const char* kept : {"file", "left.part7", "busy.part7"})
        EXPECT_EQ(readFile(folder / kept), "somebody's");
    ::close(locked);
}

TEST_F(Host, OutputSweepsWhatKilledProcessesLeft) {
    const auto yesterday = std::filesystem::file_time_type::clock::now() - std::chrono::hours(24);
    for (const auto& [name, bytes] :
         std::initializer_list<std::pair<const char*, const char*>>{{"a.wav.part123", ""},
                                                                    {"b.wav.part4", "sound"},
                                                                    {"c.wav.part", ""},
                                                                    {"part5.wav", ""},
                                                                    {"d.wav.part6", ""}})
        std::filesystem::last_write_time(folder.write(name, bytes), yesterday);
    folder.write("young.wav.part8", "");
    const int locked = ::open((folder / "d.wav.part6").c_str(), O_RDONLY);
    ASSERT_EQ(::flock(locked, LOCK_EX), 0);
    { const CHandle output(TONEWRIGHT_Host_CreateOutput((folder / "x.wav").c_str(), ".part7", 0)); }
    ::close(locked);
    EXPECT_FALSE(std::filesystem::exists(folder / "a.wav.part123"));
    for (const char* kept : {"b.wav.part4", "c.wav.part", "part5.wav", "d.wav.part6", "young.wav.part8"})
        EXPECT_TRUE(std::filesystem::exists(folder / kept)) << kept;
    std::filesystem::create_directory(folder / "more");
    std::filesystem::last_write_time(folder.write("more/song 3", ""), yesterday);
    { const CHandle output(TONEWRIGHT_Host_CreateOutput((folder / "more/x").c_str(), "7", 0)); }
    EXPECT_TRUE(std::filesystem::exists(folder / "more/song 3")) << "the suffix is a number only";
}

TEST(HostLanguage, TranslatesTheHostsOwnTextsAndTheLibrarys) {
    if (!std::filesystem::exists(TONEWRIGHT_LANGUAGES)) GTEST_SKIP() << "no language files were built";
    const auto localize = [](const char* key, const char* text, std::vector<const char*> values = {}) {
        values.push_back(nullptr);
        return std::string(Owned<char>(TONEWRIGHT_Host_Localize(key, text, values.data())).get());
    };
    // None of this needs the started library. Values are not expanded and need not be UTF-8.
    EXPECT_EQ(localize("host.exists", "%FILE% is here: %FILE%", {"%FILE%", "%FILE%\xff"}),
              "%FILE%\xff is here: %FILE%\xff");
    EXPECT_EQ(TONEWRIGHT_Host_SetLanguage("de_AT.UTF-8"), 1);
    EXPECT_EQ(localize("host.exists", "%FILE% exists", {"%FILE%", "a\xff", "%OTHER%", "b"}),
              "a\xff ist vorhanden");
    EXPECT_EQ(localize("my.key", "%A%%B%", {"%B%", "%A%", "%A%", "1"}), "1%A%");
    for (const char* unknown : {"xx", "it_IT", "de_XX", "/", "\xff"}) {
        EXPECT_EQ(TONEWRIGHT_Host_SetLanguage(unknown), 0) << unknown;
        EXPECT_NE(std::string(lastFailure().message).find("Übersetzung"), std::string::npos);
    }
    EXPECT_EQ(localize("host.unknown", "unknown"), "unbekannt") << "the language stays";
    EXPECT_EQ(TONEWRIGHT_Host_SetLanguage("en_US"), 1);
    EXPECT_EQ(localize("host.unknown", "unknown"), "unknown");
    EXPECT_FALSE(TONEWRIGHT_Host_Localize(nullptr, "text", nullptr));
    const CEnvironment all("LC_ALL", "fr_FR.UTF-8");
    EXPECT_EQ(TONEWRIGHT_Host_SetLanguage(nullptr), 1);
    EXPECT_EQ(localize("host.unknown", "unknown"), "inconnu");
    TONEWRIGHT_DeInitAll();
    EXPECT_EQ(localize("host.unknown", "unknown"), "unknown");
}

#include "host/Wav.h"
#include "support/Environment.h"
#include "support/Process.h"
#include "support/ScriptedDevice.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>
#include <tonewright/host.h>

#include <atomic>
#include <cstring>
#include <fcntl.h>
#include <fstream>
#include <random>
#include <sys/file.h>
#include <thread>
#include <unistd.h>

using namespace tests;

extern "C" int32_t cReadShortRecord(TONEWRIGHT_Handle source, int32_t* rate);

namespace {

struct SFree {
    void operator()(void* memory) const { TONEWRIGHT_Host_Free(memory); }
};
template <class Char> using Owned = std::unique_ptr<Char, SFree>;

std::u16string uriOf(const std::filesystem::path& path) {
    return Owned<char16_t>(TONEWRIGHT_Host_PathToURI(path.c_str())).get();
}

TONEWRIGHT_Failure lastFailure() {
    TONEWRIGHT_Failure failure = {};
    failure.size = sizeof failure;
    TONEWRIGHT_Host_GetLastFailure(&failure);
    return failure;
}

// Owns a handle.
struct CHandle {
    explicit CHandle(TONEWRIGHT_Handle handle) : handle(handle) {}
    ~CHandle() { TONEWRIGHT_Host_DestroyHandle(handle); }
    CHandle(const CHandle&) = delete;
    CHandle& operator=(const CHandle&) = delete;
    operator TONEWRIGHT_Handle() const { return handle; }
    TONEWRIGHT_Handle handle;
};

class Host : public testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK); }
    void TearDown() override { TONEWRIGHT_DeInitAll(); }

    int32_t encode(TONEWRIGHT_Handle source, const std::filesystem::path& target, int rate, int channels,
                   int bytes) {
        const CHandle format(
            TONEWRIGHT_CreateAudioFormatFromURI(uriOf(target).c_str(), rate, channels, bytes, 0.0, 0, 0, 0));
        const CHandle encoder(TONEWRIGHT_CreateAudioEncoder(source, format));
        return TONEWRIGHT_AudioEncoder_Encode(encoder);
    }

    CEnvironment quiet{"TONEWRIGHT_DEBUG_OUTPUT", "0"};
    CTempFolder folder;
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
            const char32_t character = random() % 3 ? 1 + random() % 0xD7FF : 0x10000 + random() % 0x100000;
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
        EXPECT_EQ(TONEWRIGHT_CreateAudioSourceFromURI(uriOf(folder / "no.wav").c_str(), 0, 2, 2, 0), nullptr);
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
}

// Checked against soxi and the encoders' own programs.
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
        TONEWRIGHT_MediaInfo info = {};
        info.size = sizeof info;
        const CHandle source(TONEWRIGHT_Host_OpenMedia(uriOf(file).c_str(), &info));
        ASSERT_TRUE(source.handle) << lastFailure().message;
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
        TONEWRIGHT_MediaInfo again = {};
        again.size = sizeof again;
        EXPECT_EQ(TONEWRIGHT_Host_GetMediaInfo(other, &again), 1);
        EXPECT_EQ(again.sampleRate, each.rate);
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
        TONEWRIGHT_MediaInfo info = {};
        info.size = sizeof info;
        const CHandle source(TONEWRIGHT_Host_OpenMedia(uriOf(file).c_str(), &info));
        EXPECT_EQ(TONEWRIGHT_Host_SetClippingPrevention(source, prevent), 1);
        EXPECT_EQ(encode(source, folder / target, 8000, 1, info.bytesPerSample), TONEWRIGHT_OK);
        const Owned<char> lines(TONEWRIGHT_Host_TakeWarnings(source));
        EXPECT_NE(std::string(lines ? lines.get() : "").find(warning), std::string::npos) << lines.get();
        EXPECT_EQ(!lines, !*warning) << target;
        const CHandle written(TONEWRIGHT_Host_OpenMedia(uriOf(folder / target).c_str(), &info));
        EXPECT_EQ(std::string(info.codec) == "PCM float 32 bit", !*warning) << info.codec;
    }
    EXPECT_EQ(TONEWRIGHT_Host_SetClippingPrevention(nullptr, 1), 0);
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
        TONEWRIGHT_Capabilities can = {};
        can.size = sizeof can;
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
    TONEWRIGHT_Capabilities can = {};
    can.size = sizeof can;
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
    TONEWRIGHT_Capabilities boxed = {}, plain = {};
    boxed.size = plain.size = sizeof plain;
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
    } cases[] = {{u"flac", TONEWRIGHT_AUDIO_SOURCE, "sonora2_flac"},
                 {u"WMA", TONEWRIGHT_AUDIO_FORMAT, "sonora2_wmf"},
                 {u"m4a", TONEWRIGHT_AUDIO_SOURCE, "sonora2_dsgraph"},
                 {u"m4a", TONEWRIGHT_AUDIO_FORMAT, ""},
                 {u"", TONEWRIGHT_AUDIO_SOURCE, ""}};
    for (const auto& each : cases) {
        TONEWRIGHT_PluginInfo info = {};
        info.size = sizeof info;
        EXPECT_EQ(TONEWRIGHT_Host_GetPlugin(each.extension, each.type, &info), *each.plugin ? 1 : 0);
        EXPECT_STREQ(info.plugin, each.plugin);
    }
    EXPECT_STREQ(lastFailure().message, "No plug-in reads files without an extension");
    EXPECT_EQ(TONEWRIGHT_Host_GetPlugin(nullptr, TONEWRIGHT_AUDIO_SOURCE, nullptr), 0);
}

// flac checks the sound that the encoder got from the host's functions.
TEST_F(Host, CallbackSourceDeliversEverySample) {
    const SSound sound = makeNoise(44100, 2, 16, 30011);
    struct SHostData {
        std::string pcm;
        size_t position = 0;
        int released = 0;
        int failAt = -1; // frame
    } data;
    data.pcm = sound.samples;
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
        {
            const CHandle source(
                TONEWRIGHT_Host_CreateSourceFromCallbacks(44100, 2, 2, length, &callbacks, &data));
            ASSERT_EQ(encode(source, folder / "out.flac", 44100, 2, 2), TONEWRIGHT_OK)
                << lastFailure().message;
            EXPECT_EQ(TONEWRIGHT_AudioSource_Open(source), TONEWRIGHT_AUDIO_FAILED); // it cannot restart
        }
        ASSERT_EQ(run({"flac", "-d", "-f", "-s", "--force-raw-format", "--endian=little", "--sign=signed",
                       "-o", folder / "out.raw", folder / "out.flac"})
                      .exitCode,
                  0);
        EXPECT_TRUE(readFile(folder / "out.raw") == data.pcm);
        std::filesystem::remove(folder / "out.flac");
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
    for (const TONEWRIGHT_Handle source : {memory.handle, file.handle}) {
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
    for (const int32_t wanted : {TONEWRIGHT_CONTINUE, TONEWRIGHT_STOP, TONEWRIGHT_DISCARD})
        for (const bool exists : {false, true}) {
            const std::filesystem::path file = folder / "out.wav";
            std::filesystem::remove(file);
            if (exists) folder.write("out.wav", "old");
            const CHandle source(TONEWRIGHT_Host_CreateSourceFromMemory(44100, 2, 2, pcm.data(), 44100 * 3));
            const CHandle format(
                TONEWRIGHT_CreateAudioFormatFromURI(uriOf(file).c_str(), 44100, 2, 2, 0.0, 0, 0, 0));
            const CHandle encoder(TONEWRIGHT_CreateAudioEncoder(source, format));
            SAnswer state{wanted};
            ASSERT_EQ(TONEWRIGHT_Host_SetEncoderProgress(encoder, answer, &state), 1);
            EXPECT_EQ(TONEWRIGHT_AudioEncoder_Encode(encoder), TONEWRIGHT_OK);
            const size_t size = readFile(file).size();
            if (wanted == TONEWRIGHT_CONTINUE) {
                EXPECT_NEAR(static_cast<double>(size), static_cast<double>(pcm.size()), 100);
                EXPECT_EQ(state.last, 1.0);
            } else if (wanted == TONEWRIGHT_STOP) {
                EXPECT_NEAR(static_cast<double>(size), static_cast<double>(pcm.size()) / 2, 50000);
            } else {
                EXPECT_EQ(std::filesystem::exists(file), exists);
                EXPECT_EQ(readFile(file), exists ? "old" : "");
            }
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
    folder.write("y.wav.part7", "somebody's");
    EXPECT_EQ(create(folder / "y.wav"), nullptr);
    EXPECT_EQ(readFile(folder / "y.wav.part7"), "somebody's");
    for (const char* bad : {"x.wav", "real", "no/such/folder.wav", "x.wav/y.wav"})
        EXPECT_EQ(create(folder / bad), nullptr) << bad;
}

// Checked by reading the copy with mutagen.
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
}

TEST_F(Host, TagsAreCopiedWhole) {
    const std::string from = folder / "a.flac";
    for (const char* name : {"a.flac", "b.flac", "c.wav"})
        ASSERT_EQ(run({"sox", "-n", "-r", "44100", "-c", "2", folder / name, "synth", "0.1", "sine", "300"})
                      .exitCode,
                  0);
    ASSERT_EQ(
        run({"metaflac", "--set-tag=COMPOSER=C. Omposer", "--set-tag=REPLAYGAIN_TRACK_GAIN=-3.2 dB", from})
            .exitCode,
        0);
    char* lost = nullptr;
    EXPECT_EQ(TONEWRIGHT_Host_CopyTags(uriOf(from).c_str(), uriOf(folder / "b.flac").c_str(), &lost), 1);
    EXPECT_EQ(lost, nullptr);
    const std::string tags = run({"metaflac", "--export-tags-to=-", folder / "b.flac"}).out;
    EXPECT_NE(tags.find("COMPOSER=C. Omposer"), std::string::npos) << tags;
    EXPECT_NE(tags.find("REPLAYGAIN_TRACK_GAIN=-3.2 dB"), std::string::npos) << tags;
    EXPECT_EQ(TONEWRIGHT_Host_CopyTags(uriOf(folder / "none.flac").c_str(), uriOf(from).c_str(), &lost), 0);
    EXPECT_NE(std::string(lastFailure().file).find("none.flac"), std::string::npos) << lastFailure().file;
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

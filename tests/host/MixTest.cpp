#include "host/Sound.h"

#include <cmath>
#include <thread>

using namespace tests;

namespace {

namespace fs = std::filesystem;

constexpr size_t kStep = 4000;  // frames; half a second at the rate of these tests
constexpr size_t kChunk = 8192; // frames of a decoder
constexpr int kRate = 8000;
const std::string kDocs = TONEWRIGHT_DOCS;

std::string makeTrack(const std::string& uri, double start, double sourceStart, double sourceEnd,
                      const std::string& fade = "") {
    const auto element = [](const char* name, double value) {
        return "<" + std::string(name) + ">" + std::to_string(value) + "</" + name + ">";
    };
    return "<Track>" + element("TrackStart", start) + element("SourceStartTime", sourceStart) +
           element("SourceEndTime", sourceEnd) + "<Uri>" + uri + "</Uri>" +
           (fade.empty() ? ""
                         : "<Modifiers><Modifier><TrackModifierFade>" + fade +
                               "</TrackModifierFade></Modifier></Modifiers>") +
           "</Track>";
}

std::string makeArrangement(const std::string& tracks) {
    return "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<Project><Tracks>" + tracks + "</Tracks></Project>\n";
}

int16_t sampleAt(const SSound& sound, size_t frame) {
    int16_t sample = 0;
    if (frame < sound.frames()) std::memcpy(&sample, sound.samples.data() + frame * 2, 2);
    return sample;
}

int mixModel(int a, int b) {
    if (a < 0 && b < 0) return a + b + a * b / 32768;
    if (a > 0 && b > 0) return a + b - a * b / 32767;
    return a + b;
}

class Mix : public CProgramTest {
protected:
    void expectRefused(const std::string& xml, const std::string& reason) {
        SCOPED_TRACE(xml);
        folder.write("bad.xml", xml);
        const std::set<std::string> before = list();
        const std::string err = fail({"mix", "bad.xml", "-o", "out.wav"});
        EXPECT_TRUE(err.starts_with("tonewright: bad.xml: ")) << err;
        EXPECT_NE(err.find(reason), std::string::npos) << err;
        EXPECT_EQ(list(), before);
    }
};

class PlayMix : public CSoundTest {
protected:
    PlayMix() : CSoundTest(EMicrophone::none) {}
};

} // namespace

TEST_F(Mix, EqualsAModel) {
    const SSound first = makeNoise(kRate, 1, 16, 3 * kRate, 1),
                 second = makeNoise(kRate, 1, 16, 3 * kRate, 2);
    write("first.wav", first);
    write("second.wav", second);
    folder.write("a.xml", makeArrangement(makeTrack("first.wav", 0, 0, 2.9) +
                                          makeTrack("second.wav", 1.2, 0.25, 2.25,
                                                    "<Duration>1.1</Duration><StartValue>0</StartValue>")));
    const std::string out =
        succeed({"mix", "a.xml", "-o", "out.wav", "--rate", "8000", "--channels", "1", "--bits", "16"});
    EXPECT_TRUE(out.starts_with("out.wav: WAV, 0:03.2, 56.1 kB, ")) << out;

    const SSound mixed = readWav("out.wav");
    EXPECT_EQ(describe(mixed), "8000_1ch_16bit");
    ASSERT_EQ(mixed.frames(), 7 * kStep); // the steps begun by 3.2 seconds
    for (size_t i = 0; i < mixed.frames(); ++i) {
        int expected = sampleAt(first, i);
        if (i >= 3 * kStep) {
            const size_t at = i - 3 * kStep;
            int sample = sampleAt(second, at + kRate / 4);
            if (at < kChunk) // the second chunk extends beyond the end of the fade
                sample = static_cast<int>(static_cast<float>(sample) *
                                          static_cast<float>(static_cast<double>(at) / kRate / 1.1));
            // The model computes the time exactly, the mixer adds steps in single precision.
            expected = mixModel(sample, expected);
            ASSERT_NEAR(sampleAt(mixed, i), expected, at < kChunk ? 2 : 0) << i;
        } else {
            ASSERT_EQ(sampleAt(mixed, i), expected) << i;
        }
    }
}

TEST_F(Mix, FindsMediaBesideTheArrangement) {
    const SSound noise = makeNoise(44100, 2, 16, 44100);
    const std::string place = "R&B #1 100% \xff";
    fs::create_directories(folder / (place + "/in"));
    struct SCase {
        const char* file; // relative to the arrangement's folder
        const char* uri;
    };
    for (const SCase& c : std::initializer_list<SCase>{{"a.wav", "a.wav"},
                                                       {"../up.wav", "../up.wav"},
                                                       {"a b.wav", "a b.wav"},
                                                       {"b c.wav", "b%20c.wav"},
                                                       {"\xc3\xa4\xe2\x82\xac.wav", "&#228;\xe2\x82\xac.wav"},
                                                       {"R&B.wav", "R&amp;B.wav"},
                                                       {"1:2.wav", "./1:2.wav"},
                                                       {"#?%.wav", "%23%3F%25.wav"},
                                                       {"\xfe.wav", "%FE.wav"}}) {
        SCOPED_TRACE(c.uri);
        const std::string in = place + "/in/";
        write(in + c.file, noise);
        folder.write(in + "-a.xml", makeArrangement(makeTrack(c.uri, 0, 0, 0.9)));
        succeed({"mix", in + "-a.xml", "-o", "out.wav", "--force"});
        EXPECT_TRUE(noise.samples.starts_with(readWav("out.wav").samples));
        fs::remove(folder / (in + c.file));
    }
    // Complete URIs are not changed.
    write("whole.wav", noise);
    folder.write("b.xml", makeArrangement(makeTrack("file://" + (folder / "whole.wav").string(), 0, 0, 0.9)));
    succeed({"mix", "b.xml", "-o", "out.flac"});
    peer({"flac", "-t", "-s", "out.flac"});
}

TEST_F(Mix, TellsWhatIsWrong) {
    write("a.wav", makeTone(44100, 2, 16, 1));
    folder.write("text.wav", "no sound");
    const std::string good = makeTrack("a.wav", 0, 0, 0.9);
    expectRefused(makeArrangement(good + makeTrack("./it's,%20gone:now%205%25.wav", 0, 0, 1)),
                  "Could not open " + (folder / "it's, gone:now 5%.wav").string() +
                      ": No such file or directory");
    expectRefused(makeArrangement(good + makeTrack("gone.wav", 60, 0, 1)),
                  "gone.wav"); // when due
    expectRefused(makeArrangement(makeTrack("text.wav", 0, 0, 1)), "text.wav");
    expectRefused(makeArrangement(makeTrack("", 0, 0, 1)), "Track 1 has no Uri");
    expectRefused(makeArrangement(good + "<Track/>"), "Track 2 has no Uri");
    expectRefused(makeArrangement(makeTrack("http://[", 0, 0, 1)), "http://[");
    expectRefused(makeArrangement(makeTrack("a.wav", 0, 1, 1)), "The arrangement is empty");
    expectRefused(makeArrangement(""), "it has no tracks");
    expectRefused("<svg/>", "it has no tracks");
    expectRefused("<Project>\n<Tracks>", "XML Parse Error in this file, line 2");
    expectRefused("", "The file is empty");
    expectRefused(makeArrangement("<Track><TrackStart>soon</TrackStart><Uri>a.wav</Uri></Track>"),
                  "TrackStart: \"soon\"");

    folder.write("good.xml", makeArrangement(good));
    EXPECT_NE(fail({"mix", "missing.xml", "-o", "out.wav"}).find("No such file"), std::string::npos);
    EXPECT_NE(fail({"mix", "good.xml", "-o", "out.xyz"}).find("No plug-in writes .xyz"), std::string::npos);
    EXPECT_NE(fail({"mix", "good.xml", "-o", "a.wav"}).find("a.wav exists"), std::string::npos);
    EXPECT_NE(fail({"mix", "good.xml", "-o", "good.xml", "-f"}).find("same file"), std::string::npos);
    EXPECT_EQ(tonewright({"mix", "good.xml", "-o", "out.wav", "--bits", "24"}).exitCode, 2);
}

TEST_F(Mix, LeavesEverythingAsItWasWhenItIsCancelled) {
    const uint32_t bytes = 6 * 3600 * 44100u * 4; // six hours in a sparse file
    folder.write("long.wav", makeWavHeader(SSound(), bytes));
    fs::resize_file(folder / "long.wav", 44 + uint64_t{bytes});
    folder.write("a.xml", makeArrangement(makeTrack("long.wav", 0, 0, 21600)));
    folder.write("out.flac", "precious");
    const std::set<std::string> before = list();
    CProcess process({kProgram, "mix", "a.xml", "-f", "-o", "out.flac", "--json"}, folder.path(),
                     programEnvironment());
    while (process.isRunning() && process.readOut().find("\"progress\"") == std::string::npos)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    EXPECT_GT(list().size(), before.size());
    process.signal(SIGINT);
    const SProcessResult result = process.wait();
    EXPECT_EQ(result.exitCode, 130) << result.err;
    EXPECT_EQ(parseLines(result.out).back()["event"], "cancelled");
    EXPECT_EQ(list(), before);
    EXPECT_EQ(readFile(folder / "out.flac"), "precious");
}

TEST_F(PlayMix, IsHeardAsItIsMixed) {
    const SSound noise = makeLoudNoise(2);
    write("noise.wav", noise);
    folder.write("a.xml",
                 makeArrangement(makeTrack("noise.wav", 0, 0, 1.5) + makeTrack("noise.wav", 0.5, 0.3, 1.9)));
    folder.write("bad.xml", makeArrangement(makeTrack("gone.wav", 0, 0, 1)));
    succeed({"mix", "a.xml", "-o", "mixed.wav"});
    const std::unique_ptr<CProcess> ears = server.listen();
    const SProcessResult result = tonewright({"play", "bad.xml", "a.xml"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_NE(result.err.find("gone.wav"), std::string::npos) << result.err;
    EXPECT_EQ(result.out, "a.xml: 0:02.1 played\n");
    const std::string heard = withoutGaps(ears->readOut()), mixed = withoutGaps(readWav("mixed.wav").samples);
    EXPECT_EQ(heard.size(), mixed.size());
    EXPECT_TRUE(heard == mixed) << std::mismatch(heard.begin(), heard.end(), mixed.begin()).first -
                                       heard.begin();
}

TEST_F(Mix, SchemaAcceptsWhatIsWrittenWellOnly) {
    const auto isValid = [&](const fs::path& file) {
        return run({"xmllint", "--noout", "--relaxng", kDocs + "/arrangement.rng", file}, folder.path())
                   .exitCode == 0;
    };
    EXPECT_TRUE(isValid(kDocs + "/examples/arrangement.xml"));
    const std::string end = "<SourceEndTime>1</SourceEndTime>", uri = "<Uri>a.wav</Uri>";
    const auto inTrack = [&](const std::string& more) { return "<Track>" + end + uri + more + "</Track>"; };
    const auto inFade = [&](const std::string& text) {
        return inTrack("<Modifiers><Modifier><TrackModifierFade>" + text +
                       "</TrackModifierFade></Modifier></Modifiers>");
    };
    for (const auto& [valid, tracks] : std::initializer_list<std::pair<bool, std::string>>{
             {true, ""},
             {true, "<Track>" + uri + end + "<TrackStart> 2e-3 </TrackStart></Track>"},
             {true, inTrack("<Modifiers/>")},
             {true, inTrack("<Modifiers><Modifier/></Modifiers>")},
             {true, inFade("<EndValue>-0.5</EndValue><Duration>1</Duration>")},
             {false, "<Track>" + end + "</Track>"},
             {false, "<Track>" + uri + "</Track>"},
             {false, "<Track>" + end + "<Uri/></Track>"},
             {false, inTrack(uri)},
             {false, inTrack("<TrackStart>1,5</TrackStart>")},
             {false, inTrack("<TrackStart>-1</TrackStart>")},
             {false, inTrack("<TrackStart>INF</TrackStart>")},
             {false, inTrack("<TrackStart/>")},
             {false, inTrack("<trackStart>1</trackStart>")},
             {false, inTrack("<TrackModifierFade/>")},
             {false, inTrack("<Modifiers><TrackModifierFade/></Modifiers>")},
             {false, inFade("<StartValue>0</StartValue>")},
             {false, inFade("<Duration>1</Duration><EndValue>NaN</EndValue>")},
             {false, "<Tracks/>"}}) {
        folder.write("case.xml", makeArrangement(tracks));
        EXPECT_EQ(isValid(folder / "case.xml"), valid) << tracks;
    }
    for (const auto& [valid, text] : std::initializer_list<std::pair<bool, std::string>>{
             {true, "<a b='1'><Zoom x='1'>2<y/></Zoom><Tracks/></a>"},
             {false, "<a/>"},
             {false, "<a><Tracks/><Tracks/></a>"}}) {
        folder.write("case.xml", text);
        EXPECT_EQ(isValid(folder / "case.xml"), valid) << text;
    }
}

#include "host/Sound.h"

using namespace tests;

namespace {

namespace fs = std::filesystem;

const std::string kDocs = TONEWRIGHT_DOCS;

std::string makeTrack(const std::string& uri, double start, double sourceStart, double sourceEnd) {
    const auto element = [](const char* name, double value) {
        return "<" + std::string(name) + ">" + std::to_string(value) + "</" + name + ">";
    };
    return "<Track>" + element("TrackStart", start) + element("SourceStartTime", sourceStart) +
           element("SourceEndTime", sourceEnd) + "<Uri>" + uri + "</Uri></Track>";
}

std::string makeArrangement(const std::string& tracks) {
    return "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<Project><Tracks>" + tracks + "</Tracks></Project>\n";
}

class Mix : public CProgramTest {
protected:
    void expectRefused(const std::string& xml, const std::string& reason) {
        SCOPED_TRACE(xml);
        folder.write("bad.xml", xml);
        const std::set<std::string> before = list();
        const std::string err = fail({"mix", "bad.xml", "-o", "out.wav"});
        EXPECT_TRUE(err.starts_with("tonewright: bad.xml: ")) << err;
        EXPECT_TRUE(has(err, reason));
        EXPECT_EQ(list(), before);
    }
};

class PlayMix : public CSoundTest {
protected:
    PlayMix() : CSoundTest(EMicrophone::none) {}
};

} // namespace

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
    const std::string out = succeed({"mix", "b.xml", "-o", "out.flac", "--rate", "8000", "--channels", "1"});
    EXPECT_TRUE(out.starts_with("out.flac: FLAC, 0:00.9, ")) << out;
    EXPECT_EQ(probe("out.flac"), "flac,8000,1");
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
    expectRefused("<Project>\n<Tracks>", "XML Parse Error in this file, line 2");
    expectRefused("", "The file is empty");
    expectRefused(makeArrangement("<Track><TrackStart>soon</TrackStart><Uri>a.wav</Uri></Track>"),
                  "TrackStart: \"soon\"");

    folder.write("good.xml", makeArrangement(good));
    EXPECT_TRUE(has(fail({"mix", "missing.xml", "-o", "out.wav"}), "No such file"));
    EXPECT_TRUE(has(fail({"mix", "good.xml", "-o", "out.xyz"}), "No plug-in writes .xyz"));
    EXPECT_TRUE(has(fail({"mix", "good.xml", "-o", "a.wav"}), "a.wav exists"));
    EXPECT_TRUE(has(fail({"mix", "good.xml", "-o", "good.xml", "-f"}), "same file"));
    EXPECT_EQ(tonewright({"mix", "good.xml", "-o", "out.wav", "--bits", "24"}).exitCode, 2);
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
    EXPECT_TRUE(has(result.err, "gone.wav"));
    EXPECT_EQ(result.out, "a.xml: 0:02.1 played\n");
    const std::string heard = withoutGaps(ears->readOut()), mixed = withoutGaps(readWav("mixed.wav").samples);
    EXPECT_EQ(heard.size(), mixed.size());
    EXPECT_TRUE(heard == mixed) << std::mismatch(heard.begin(), heard.end(), mixed.begin()).first -
                                       heard.begin();
}

TEST_F(Mix, SchemaAcceptsWhatIsWrittenWellOnly) {
    const std::string schema = kDocs + "/arrangement.rng", end = "<SourceEndTime>1</SourceEndTime>",
                      track = "<Track>" + end + "<Uri>a.wav</Uri>",
                      fade = track + "<Modifiers><Modifier><TrackModifierFade>";
    const auto isValid = [&](const fs::path& file) {
        return run({"xmllint", "--noout", "--relaxng", schema, file}, folder.path()).exitCode == 0;
    };
    EXPECT_TRUE(isValid(kDocs + "/examples/arrangement.xml"));
    for (const auto& [valid, tracks] : std::initializer_list<std::pair<bool, std::string>>{
             {true, track + "<TrackStart> 2e-3 </TrackStart></Track>"},
             {true, fade + "<Duration>1</Duration></TrackModifierFade></Modifier></Modifiers></Track>"},
             {false, fade + "</TrackModifierFade></Modifier></Modifiers></Track>"},
             {false, "<Track>" + end + "</Track>"},
             {false, track + "<TrackStart>1,5</TrackStart></Track>"},
             {false, "<Tracks/>"}}) {
        folder.write("case.xml", makeArrangement(tracks));
        EXPECT_EQ(isValid(folder / "case.xml"), valid) << tracks;
    }
}

#include "tonewright/EditorXml.h"

#include "Library.h"
#include "peru/Errors.h"
#include "sonora2/context/LastFailure.h"
#include "sonora2/context/LogManager.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/plugins/PluginHandler.h"
#include "sonora2/tracks/TrackCommands.h"
#include "support/Files.h"
#include "tonewright/TrackModifierFade.h"
#include "tonewright/TracklistAudioSource.h"
#include "tonewright/TracklistAudioTrack.h"

#include <gmock/gmock.h>

#include <cmath>
#include <random>

namespace {

using namespace tests;
using namespace tonewright;
using sonora2::audio::IAudioChunk;

using Samples = std::vector<int16_t>;

void append(Samples& samples, const P<IAudioChunk>& chunk) {
    const auto* data = reinterpret_cast<const int16_t*>(chunk->getData());
    samples.insert(samples.end(), data, data + chunk->getSize() / sizeof(int16_t));
}

std::string describe(const std::vector<P<CTrack>>& tracks) {
    std::string text;
    const auto add = [&](double value) { text += " " + std::to_string(value).substr(0, 5); };
    for (const P<CTrack>& track : tracks) {
        text += "[" + tests::text(track->getURI()->getAsString());
        add(track->getTrackStart());
        add(track->getSourceStartTime());
        add(track->getSourceEndTime());
        for (int32_t i = 0; i < track->getModifierCount(); ++i) {
            const P<CTrackModifierFade> fade(track->getModifierAt(i));
            text += " fade";
            add(fade->getTimestamp());
            add(fade->getDuration());
            add(fade->getStartValue());
            add(fade->getEndValue());
        }
        text += "]";
    }
    return text;
}

TEST(EditorXml, Text_BecomesTracks) {
    struct SCase {
        const char* xml;
        const char* tracks;
    };
    for (const SCase& c : std::initializer_list<SCase>{
             {"<?xml version=\"1.0\" encoding=\"utf-8\"?><Project><Tracks><Track><TrackStart>1.5</TrackStart>"
              "<SourceStartTime>2</SourceStartTime><SourceEndTime>3.25</SourceEndTime>"
              "<Uri>file:///a%20b.wav</Uri></Track></Tracks></Project>",
              "[file:///a%20b.wav 1.500 2.000 3.250]"},
             {"<x><Tracks/></x>", ""},
             {"<x/>", ""},
             {"<x><y><Tracks><Track/></Tracks></y></x>", ""},
             {"<x><Tracks><Track/></Tracks></x>", "[ 0.000 0.000 0.000]"},
             {"<x><Tracks><Track><TrackStart></TrackStart><TrackStart>9</TrackStart><New>1</New></Track>"
              "<Other/><Track><Uri>b.mp3</Uri><SourceEndTime>\n -1e-1 \n</SourceEndTime></Track></Tracks>"
              "<Tracks><Track/></Tracks></x>",
              "[ 0.000 0.000 0.000][b.mp3 0.000 0.000 -0.10]"},
             {"<x><Tracks><Track><Modifiers><Modifier><Other/></Modifier><Modifier/><TrackModifierFade/>"
              "<Modifier><TrackModifierFade/></Modifier><Modifier><TrackModifierFade><Timestamp>1</Timestamp>"
              "<Duration>2</Duration><StartValue>0.5</StartValue><EndValue>0</EndValue></TrackModifierFade>"
              "</Modifier></Modifiers></Track></Tracks></x>",
              "[ 0.000 0.000 0.000 fade 0.000 0.000 1.000 1.000 fade 1.000 2.000 0.500 0.000]"},
         })
        EXPECT_EQ(describe(readEditorXml(peru::CString::fromUTF8(c.xml))), c.tracks) << c.xml;
    for (const char16_t* start : {u"", u"\uFEFF", u"<?xml version='1.0' encoding='ISO-8859-1'?>"}) {
        const std::u16string xml =
            std::u16string(start) + u"<x><Tracks><Track><Uri>file:///\u00e4.wav</Uri></Track></Tracks></x>";
        EXPECT_EQ(describe(readEditorXml(xml.c_str())), "[file:///%C3%A4.wav 0.000 0.000 0.000]");
    }
}

TEST(EditorXml, BadText_IsRefused) {
    for (const char* xml : {"<x><Tracks></x>", "<x", "no markup",
                            "<x><Tracks><Track><TrackStart>soon</TrackStart></Track></Tracks></x>",
                            "<x><Tracks><Track><SourceEndTime>1,5</SourceEndTime></Track></Tracks></x>",
                            "<x><Tracks><Track><SourceEndTime>inf</SourceEndTime></Track></Tracks></x>",
                            "<x><Tracks><Track><SourceEndTime>1e300</SourceEndTime></Track></Tracks></x>",
                            "<x><Tracks><Track><TrackStart>-4000001</TrackStart></Track></Tracks></x>",
                            "<x><Tracks><Track><TrackStart>nan</TrackStart></Track></Tracks></x>"})
        EXPECT_THROW(readEditorXml(xml), peru::CParseError) << xml;
    EXPECT_THROW(readEditorXml("<x><Tracks><Track><Uri>http://[</Uri></Track></Tracks></x>"),
                 peru::CURIFormatError);
    EXPECT_EQ(errorOf([] {
                  readEditorXml("<x><Tracks><Track><TrackStart>soon</TrackStart></Track></Tracks></x>");
              }),
              "Error parsing floating point value. (TrackStart: \"soon\")");
}

constexpr int kRate = 1024; // times in powers of two are exact
constexpr int kStep = 4000;

// Arrangements of media created by a test plug-in: "<seconds>.tst".
class Arrangement : public testing::Test {
protected:
    Arrangement() {
        context->addPluginName("none");
        handler = peru::make<sonora2::common::CPluginHandler>(context);
        plugin->makeSource = [this](const P<peru::IURI>& uri,
                                    const auto& params) -> P<sonora2::common::ISource> {
            if (uri->getAsString()->find("missing").isFound()) return nullptr;
            SFakeSource script;
            script.rate = params.nSampleRate;
            script.channels = params.nChannelCount;
            script.frames = static_cast<int64_t>(std::stod(text(uri->getAsString())) * script.rate);
            script.chunkFrames = chunkFrames;
            return peru::make<CFakeSource>(script, uri);
        };
        handler->addPlugin(plugin, plugin);
    }

    static P<CTrack> makeTrack(const char* uri, double start, double sourceStart, double sourceEnd) {
        const P<CTrack> track = peru::make<CTrack>();
        track->setURI(peru::make<peru::CURI>(uri));
        track->setTrackStart(start);
        track->setSourceStartTime(sourceStart);
        track->setSourceEndTime(sourceEnd);
        return track;
    }
    P<CTracklistAudioSource> makeSource(const std::vector<P<CTrack>>& tracks, int rate = kRate) {
        return CTracklistAudioSource::create(tracks, handler, context->getLogManager(), rate, 1, 2);
    }
    static Samples readAll(const P<sonora2::common::IAudioSource>& source) {
        Samples samples;
        while (!source->isEOF()) append(samples, source->getNextAudioChunk());
        return samples;
    }

    int chunkFrames = 256;
    P<sonora2::audio::CSonoraContextAudio> context = peru::make<sonora2::audio::CSonoraContextAudio>();
    P<CFakePlugin> plugin = peru::make<CFakePlugin>("fake", std::initializer_list<const char*>{"tst"});
    P<sonora2::common::CPluginHandler> handler;
};

TEST_F(Arrangement, Fade_WorksOnChunksThatLieWhollyInIt) {
    struct SFade {
        double timestamp, duration, startValue, endValue;
    };
    struct SCase {
        const char* name;
        double sourceStart;
        std::vector<SFade> fades;
    };
    // Chunks are a quarter of a second long; after 0.5 the samples are above 2000.
    for (const SCase& c : std::initializer_list<SCase>{
             {"aligned", 0.0, {{0.25, 0.25, 0.0, 1.0}}},
             {"shorter than a chunk", 0.0, {{0.25, 0.2421875, 0.0, 1.0}}},
             {"over several", 0.0, {{0.125, 1.0, 1.0, 0.25}}},
             {"counts from the source's start", 0.5, {{0.0, 0.5, 0.0, 1.0}}},
             {"clips on both sides", 1.0, {{0.0, 4.0, -30.0, 30.0}}},
             {"two at once", 0.0, {{0.0, 2.0, 0.0, 0.7}, {0.5, 1.0, 1.0, 0.1}}},
             {"rounded to floats", 0.0, {{0.0, 3.0, 0.1, 0.7}}},
         }) {
        SCOPED_TRACE(c.name);
        const P<CTrack> data = makeTrack("4.tst", 10.0, c.sourceStart, 4.0);
        for (const SFade& f : c.fades)
            data->addModifier(
                peru::make<CTrackModifierFade>(f.timestamp, f.startValue, f.endValue, f.duration));
        const auto track = peru::make<CTracklistAudioTrack>(handler, data, kRate, 1, 2, 0);
        EXPECT_FALSE(track->getNextAudioChunk()) << "closed";
        track->open();
        int changed = 0;
        int64_t position = static_cast<int64_t>(c.sourceStart * kRate);
        for (; const P<IAudioChunk> chunk = track->getNextAudioChunk(); position += 256) {
            Samples expected;
            for (int i = 0; i < 256; ++i) expected.push_back(static_cast<int16_t>((position + i) * 4));
            const Samples plain = expected;
            for (const SFade& f : c.fades) {
                const double time = static_cast<double>(position) / kRate,
                             begin = c.sourceStart + f.timestamp;
                if (time < begin || time + 0.25 > begin + f.duration) continue;
                float t = static_cast<float>(time - begin);
                for (int16_t& sample : expected) {
                    const float delta = static_cast<float>(f.endValue) - static_cast<float>(f.startValue);
                    const float gain = static_cast<float>(t / f.duration * delta + f.startValue);
                    const float product = static_cast<float>(sample) * gain;
                    sample = product < -32768.0F  ? -32768
                             : product > 32767.0F ? 32767
                                                  : static_cast<int16_t>(std::trunc(product));
                    t += static_cast<float>(1.0 / kRate);
                }
            }
            changed += expected != plain ? 1 : 0;
            Samples played;
            append(played, chunk);
            ASSERT_TRUE(played == expected) << "at frame " << position;
        }
        EXPECT_EQ(position, 4 * kRate);
        EXPECT_EQ(changed > 0, std::string(c.name) != "shorter than a chunk");
    }
}

TEST_F(Arrangement, Source_PlaysTracksOverASilentBed) {
    const double step = static_cast<double>(kStep) / kRate;
    const P<CTracklistAudioSource> source = makeSource(
        {makeTrack("60.tst", 4 * step, 1.0, 1.0 + step), makeTrack("60.tst", 0.0, 0.5, 0.5 + step),
         makeTrack("1.tst", 2.5 * step, 0.0, step)}); // begins with a step, and is shorter than its range
    EXPECT_EQ(source->getDuration(), std::round(5 * step * 1000.0) / 1000.0);
    EXPECT_EQ(text(source->getPluginName()), "XMLAudioSource");
    EXPECT_EQ(text(source->getAudioStreamInfos()->getStreamInfo(0)->getStreamLanguage()), "und");
    EXPECT_FALSE(source->isOpened());
    for (int run = 0; run < 2; ++run) {
        source->open();
        const Samples played = readAll(source);
        ASSERT_EQ(played.size(), 5u * kStep);
        for (int i = 0; i < 5 * kStep; ++i) {
            int expected = 0;
            if (i < 2 * kStep) expected = (512 + i) * 4; // the step at its end belongs to a track
            if (i >= 3 * kStep && i < 3 * kStep + kRate) expected = (i - 3 * kStep) * 4;
            if (i >= 4 * kStep) expected = (1024 + i - 4 * kStep) * 4;
            ASSERT_EQ(played[static_cast<size_t>(i)], static_cast<int16_t>(expected & 0x7fff)) << i;
        }
        source->close();
        EXPECT_EQ(CFakeSource::s_alive, 0);
    }
}

TEST_F(Arrangement, Skip_DeliversTheChunkInHandAndThenTheTime) {
    // Steps of half a second; tracks begin and end with them.
    std::vector<P<CTrack>> tracks = {makeTrack("100.tst", 0.0, 0.0, 60.0)};
    for (int i = 0; i < 30; ++i) tracks.push_back(makeTrack("9.tst", i * 2.0, 1.5, 1.5 + 0.5 * (i % 9)));
    const P<CTracklistAudioSource> source = makeSource(tracks, 8000);
    source->open();
    const Samples whole = readAll(source);
    ASSERT_EQ(whole.size(), 120u * kStep);
    source->close();
    source->open();
    std::mt19937 random(2);
    size_t next = 0;
    for (int i = 0; i < 1000; ++i) {
        const auto expectStep = [&](size_t step) {
            const P<IAudioChunk> chunk = source->getNextAudioChunk();
            ASSERT_TRUE(chunk);
            ASSERT_EQ(chunk->getTimestamp(), static_cast<double>(step) * 0.5);
            Samples played;
            append(played, chunk);
            ASSERT_TRUE(std::equal(played.begin(), played.end(), whole.begin() + step * kStep))
                << "skip " << i;
        };
        const size_t step = random() % 118;
        source->skipToTime(static_cast<double>(step) * 0.5);
        ASSERT_NO_FATAL_FAILURE(expectStep(next));
        ASSERT_NO_FATAL_FAILURE(expectStep(step));
        next = step + 1;
    }
}

TEST_F(Arrangement, WithoutTracks_IsAtItsEndAtOnce) {
    const P<CTracklistAudioSource> source = makeSource({});
    EXPECT_EQ(source->getDuration(), 0.0);
    EXPECT_TRUE(source->isEOF());
    source->open();
    EXPECT_TRUE(source->isOpened());
    EXPECT_TRUE(source->isEOF());
}

TEST_F(Arrangement, MediumThatIsMissing_EndsTheReadingWhenItIsDue) {
    const char* message = "could not open source in CTracklistAudioTrack: file:///missing.tst";
    const P<CTracklistAudioSource> atStart = makeSource({makeTrack("file:///missing.tst", 0.0, 0.0, 9.0)});
    EXPECT_EQ(tests::errorOf([&] { atStart->open(); }), message);
    EXPECT_FALSE(atStart->isOpened());

    const P<CTracklistAudioSource> later = makeSource(
        {makeTrack("90.tst", 0.0, 0.0, 90.0), makeTrack("file:///missing.tst", 4 * 3.90625, 0.0, 9.0)});
    later->open();
    Samples played;
    for (int i = 0; i < 3; ++i) append(played, later->getNextAudioChunk());
    EXPECT_EQ(tests::errorOf([&] { append(played, later->getNextAudioChunk()); }), message);
    EXPECT_TRUE(later->isEOF());
    later->close();
    EXPECT_EQ(CFakeSource::s_alive, 0);
}

// Through the exports.
class EditorExport : public CLibraryTest {
protected:
    bool hasLine(const std::string& part) const {
        const std::vector<SLine> lines = log->take();
        return std::any_of(lines.begin(), lines.end(),
                           [&](const SLine& line) { return line.text.find(part) != std::string::npos; });
    }
};

TEST_F(EditorExport, BadArrangement_GivesNothingAndALine) {
    EXPECT_FALSE(CHandle(TONEWRIGHT_CreateAudioSourceFromEditorXml(u"<a>", 44100, 2, 2)));
    EXPECT_TRUE(hasLine("XML Parse Error, line"));
    EXPECT_FALSE(CHandle(TONEWRIGHT_CreateAudioSourceFromEditorXml(u"<a/>", 44100, 0, 2)));
    EXPECT_TRUE(hasLine("0 channels"));

    const CHandle missing(TONEWRIGHT_CreateAudioSourceFromEditorXml(
        u"<x><Tracks><Track><SourceEndTime>0.5</SourceEndTime><Uri>file:///none/gone.flac</Uri></Track></"
        u"Tracks></x>",
        44100, 2, 2));
    ASSERT_TRUE(missing) << "nothing is opened yet";
    EXPECT_NE(TONEWRIGHT_AudioSource_Open(missing.get()), TONEWRIGHT_OK);
    EXPECT_TRUE(hasLine("could not open source in CTracklistAudioTrack: file:///none/gone.flac"));
    EXPECT_THAT(sonora2::common::getLastFailure().message,
                testing::EndsWith("gone.flac: No such file or directory"));
    EXPECT_EQ(TONEWRIGHT_AudioSource_IsOpened(missing.get()), 0);
}

} // namespace

#include "isolation/BoxedFixture.h"
#include "isolation/plugin/Faults.h"
#include "sonora2/boxed/FormatClient.h"
#include "sonora2/boxed/FormatProbe.h"
#include "sonora2/boxed/PluginModuleBoxed.h"
#include "sonora2/boxed/SlaveHandler.h"
#include "sonora2/boxed/SourceClient.h"
#include "sonora2/media/IFormatSettings.h"
#include "sonora2/pictures/RGBPicture.h"
#include "sonora2/plugins/PluginModule.h"
#include "support/Process.h"

#include <gmock/gmock.h>

#include <cstdlib>
#include <numeric>
#include <sstream>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

namespace {

using namespace tests;
using namespace sonora2::common;
using peru::interfaceCast;
using testing::AnyOf;
using testing::HasSubstr;
using testing::Not;

struct SFault {
    const char* name;
    const char* message; // part of it
};

// With sanitizers, some crashes are exits with an error of theirs.
#ifdef TONEWRIGHT_SANITIZED
constexpr const char* kSegmentation = "sonora2_faulty";
constexpr const char* kAbort = "sonora2_faulty";
#else
constexpr const char* kSegmentation = "SIGSEGV";
constexpr const char* kAbort = "SIGABRT";
#endif

constexpr const char* kSourceOperations =
    "create isOpened open close skipToTime getDuration isEOF getBufferStatus setStartTime getStartTime "
    "setMaxSize getWidth getHeight getNextPicture getFrameRateNum peekNextPictureTimestamp getPixelAspectNum "
    "getPixelAspectDen getFrameRateDen getFrameDuration getAudioStreamInfos setAudioStream getNextAudioChunk "
    "getSampleRate getChannelCount getBytesPerSample";
constexpr const char* kFormatOperations =
    "create isOpened open close getEstimatedSizeBytes getVideoParameter writeFrame getWantedImageType "
    "getSampleRate getChannelCount getBytesPerSample setAudioQuality setAudioBitRate writeAudioChunk";
const SFault kFaults[] = {
    {"null-write", kSegmentation},
    {"throw-int", "exception"},
    {"abort", kAbort},
    {"exit", "exit code 3"},
    {"hang", "does not respond"},
    {"throw-std", "a mistake of the plug-in"},
    {"kill", "signal 9"},
    {"stack-overflow", kSegmentation},
    {"flood-log", ""},
    {"throw-own", "an error of the plug-in"},
    {"terminate", kAbort},
#ifndef TONEWRIGHT_SANITIZED // which reserve more memory than any limit
    {"allocate", "bad_alloc"},
#endif
};

// Each operation with one of the faults, so that all of both occur; with all of them if the variable is set.
template <class Check> void forEachFault(const char* operations, const Check& check) {
    const bool isFull = std::getenv("TONEWRIGHT_TEST_ALL_FAULTS") != nullptr;
    size_t next = 0;
    std::istringstream words(operations);
    for (std::string operation; words >> operation;)
        for (size_t i = 0; i < (isFull ? std::size(kFaults) : 1); ++i)
            check(kFaults[next++ % std::size(kFaults)], operation.c_str());
}

std::string nameOf(const SFault& fault, const char* operation, const char* extension = ".faulty") {
    return std::string(fault.name) + "@" + operation + extension;
}

// The second one if the machine is so busy that the slave has not even started.
const auto kIsTimeout = AnyOf(HasSubstr("does not respond"), HasSubstr("Client connection disappeared"));

class Faults : public Boxed {
protected:
    // Returns the message of the job.
    template <class Job> std::string expectError(const SFault& fault, const Job& job) {
        const bool isHang = fault.name == std::string("hang");
        setDeadline(isHang ? 500 : 30'000);
        const std::string message = job();
        if (isHang)
            EXPECT_THAT(message, kIsTimeout);
        else if (*fault.message)
            EXPECT_THAT(message, HasSubstr(fault.message)) << fault.name;
        else
            EXPECT_EQ(message, "") << fault.name;
        setDeadline(30'000);
        return message;
    }
};

// The next pictures of a video, their times and bytes.
std::string readPictures(const P<ISource>& source) {
    std::string pictures;
    const P<IVideoSource> video(source);
    while (!source->isEOF()) {
        const double next = video->peekNextPictureTimestamp();
        if (const P<ISonoraPicture> picture = video->getNextPicture())
            pictures +=
                joined(next, picture->getTimestamp(), picture->getRGBBlock(0, 0, 2, 2)->getData()[15]);
    }
    return pictures + (video->getNextPicture() ? "more" : "end");
}

// Sources and formats in a process of their own, beside the same ones in this process.
class Transparency : public Boxed {
protected:
    class CCalls : public peru::CObject, public ILogManager {
    public:
        void log(int32_t severity, const P<peru::IString>& line) override {
            m_calls += (severity == kSeverityTrace ? "" : std::to_string(severity) + " ") + text(line) + ";";
        }
        void logException(const peru::CException& exception) override {
            m_calls += "9 " + text(exception.getTitle()) + ", " + text(exception.getDescription()) + ";";
        }
        std::string take() { return std::exchange(m_calls, {}); }

    private:
        std::string m_calls;
    };

    void apply(const P<ISource>& source) {
        source->setStartTime(0.25);
        interfaceCast<IVideoSource>(source)->setMaxSize(m_size[0], m_size[1]);
        interfaceCast<IAudioSource>(source)->setAudioStream(1);
        interfaceCast<ISalvage>(source)->setSalvage(true);
        interfaceCast<IClippingPrevention>(source)->setClippingPrevention(true);
        interfaceCast<IMediaDescription>(source)->setDeliveredFormat(44'100, 1, 3);
    }
    P<ISource> makeSource(const std::string& name, int frames) {
        return m_boxed->tryCreateSource(toURI(m_media.write(name, std::to_string(frames))), kSource, true,
                                        nullptr);
    }

    const P<CCalls> m_calls = [this] {
        const auto calls = peru::make<CCalls>();
        m_context->setLogManager(calls);
        return calls;
    }();
    const P<ISonoraPlugin> m_plain =
        peru::make<CPluginModule>(m_context, toURI(FAULTY_PLUGINS "/sonora2_faulty.so"));
    const P<CPluginModuleBoxed> m_boxed = peru::make<CPluginModuleBoxed>(m_context, m_name);
    int m_size[2] = {300, 0};
    static constexpr int kSource = kAudioSource | kVideoSource, kFormat = kAudioFormat | kVideoFormat;
};

} // namespace

TEST_F(Faults, EveryFaultEndsItsJobAndLeavesNoFile) {
    setMemory(128);
    for (const SFault& fault : kFaults) {
        expectError(fault, [&] { return decode(nameOf(fault, "getNextAudioChunk")); });
        if (*fault.message)
            expectError(fault, [&] { return encode(m_out / nameOf(fault, "writeAudioChunk")); });
        EXPECT_EQ(countEntries(m_out.path()), 0u) << fault.name;
    }
    setMemory(1024);
    constexpr SFault kExit = {"exit", "exit code 3"}, kError = {"throw-own", "an error of the plug-in"};
    for (const SFault& fault : {kExit, kError}) {
        for (const char* operation : {"create", "open", "close"})
            expectError(fault, [&] { return decode(nameOf(fault, operation)); });
        for (const char* operation : {"create", "setAudioQuality", "open", "close"})
            expectError(fault, [&] { return encode(m_out / nameOf(fault, operation)); });
    }
    EXPECT_EQ(countEntries(m_out.path()), 0u);
    const auto existing = m_out.write(nameOf(kExit, "close"), "old");
    expectError(kExit, [&] { return encode(existing); });
    EXPECT_EQ(readFile(existing), "old");
    EXPECT_EQ(countEntries(m_out.path()), 1u);
    expectHealthy();
}

// Closing a file may take ten times as long as another operation.
TEST_F(Boxed, ClosingMayTakeLonger) {
    setDeadline(200);
    EXPECT_THAT(encode(m_out / "hang@close.faulty"), kIsTimeout);
    EXPECT_EQ(countEntries(m_out.path()), 0u);
    EXPECT_THAT(encode(m_out / "pause@close.faulty"), AnyOf("", kIsTimeout)); // as for a slow disk
    setDeadline(30'000);
    expectHealthy();
}

#ifndef TONEWRIGHT_SANITIZED // which replace vfork
TEST_F(Boxed, WaitingForADeviceIsNoHang) {
    const CEnvironment noSandbox("TONEWRIGHT_BOXED_SANDBOX", "none"); // which refuses a second process
    setDeadline(1'000);
    EXPECT_THAT(encode(m_out / "wait-for-device@open.faulty"),
                AnyOf("", HasSubstr("Client connection disappeared"))); // on a very busy machine
}
#endif

TEST_F(Boxed, PipeFolderOfOthersIsAnError) {
    const auto pipes = m_out / "tonewright-pipes";
    std::filesystem::create_directory(pipes);
    std::filesystem::permissions(pipes, std::filesystem::perms(0755));
    {
        const CEnvironment variable("XDG_RUNTIME_DIR", m_out.path().string());
        EXPECT_THAT(decode("x.faulty"), HasSubstr("could not be created"));
    }
    expectHealthy();
}

TEST_F(Faults, EveryOperationOfASourceMayFail) {
    setMemory(128);
    forEachFault(kSourceOperations, [this](const SFault& fault, const char* operation) {
        expectError(fault, [&] { return watch(nameOf(fault, operation, ".movie.faulty")); });
    });
    setMemory(1024);
    expectHealthy();
}

TEST_F(Faults, EveryOperationOfAFormatMayFail) {
    setMemory(128);
    forEachFault(kFormatOperations, [this](const SFault& fault, const char* operation) {
        const auto target = m_out / nameOf(fault, operation);
        const bool isWritten = expectError(fault, [&] { return produce(target); }).empty();
        EXPECT_EQ(std::filesystem::exists(target), isWritten) << target;
    });
    setMemory(1024);
    expectHealthy();
}

// Nobody can be told about these.
TEST_F(Faults, FaultsOfDestructorsStayInTheSlave) {
    setMemory(128);
    setDeadline(500);
    for (const SFault& fault : kFaults) {
        const std::string name = nameOf(fault, "destroy");
        EXPECT_THAT(watch(name), AnyOf("", kIsTimeout)) << fault.name;
        EXPECT_THAT(produce(m_out / name), AnyOf("", kIsTimeout)) << fault.name;
    }
    setDeadline(30'000);
    setMemory(1024);
    expectHealthy();
}

TEST_F(Boxed, NonsenseOnTheWireIsAnError) {
    const size_t before = countDescriptors();
    for (const char* order :
         {"garbage@create.faulty", "garbage@getNextAudioChunk.faulty", "close-all@open.faulty"})
        EXPECT_THAT(decode(order), Not("")) << order;
    EXPECT_THAT(decode("long-answer@getNextAudioChunk.faulty"), HasSubstr("more than the 16777216 bytes"));
    expectHealthy();
    EXPECT_TRUE(waitUntil([&] { return countDescriptors() <= before + 1; })); // the random numbers' device
}

TEST_F(Boxed, HostilePluginsReachNothing) {
    const auto victim = m_media.write("private.txt", "secret");
    const std::string socketPath = m_media / "socket";
    const int listener = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    socketPath.copy(address.sun_path, sizeof address.sun_path - 1);
    ASSERT_EQ(::bind(listener, reinterpret_cast<sockaddr*>(&address), sizeof address), 0);
    ASSERT_EQ(::listen(listener, 8), 0);
    const CEnvironment file(faulty::kVictimFile, victim.string());
    const CEnvironment peer(faulty::kVictimSocket, socketPath);

    for (const char* attempt :
         {"read-outside", "write-outside", "connect", "exec", "fork", "signal-parent", "trace-parent"}) {
        for (const char* operation : {"create", "getNextAudioChunk"})
            EXPECT_THAT(decode(nameOf({attempt, ""}, operation)), HasSubstr("refused")) << attempt;
        EXPECT_THAT(encode(m_out / nameOf({attempt, ""}, "writeAudioChunk")), HasSubstr("refused"))
            << attempt;
    }
    EXPECT_EQ(readFile(victim), "secret");
    EXPECT_LT(::accept(listener, nullptr, nullptr), 0);
    ::close(listener);
    expectHealthy();
}

TEST_F(Transparency, SourceInASlaveIsLikeAnother) {
    const auto uri = toURI(m_media.write("log-exception@setMaxSize.movie.faulty", "1500"));
    ISonoraPlugin::SSourceParams params;
    params.nSampleRate = 800;
    m_context->setFlags(0x8000000000000005u);
    m_context->setParameter(9, "test", peru::newString("a parameter"));
    for (const bool prefetched : {false, true}) {
        SCOPED_TRACE(prefetched);
        m_context->setSwitchB(prefetched);
        if (prefetched) std::swap(m_size[0], m_size[1]);
        const std::string replayed = "setSalvage 1;setClippingPrevention 1;setDeliveredFormat 44100 1 3;"
                                     "setAudioStream 1;setStartTime 0.250000;setMaxSize " +
                                     std::to_string(m_size[0]) + " " + std::to_string(m_size[1]) +
                                     ";9 title, text;open;";
        const P<ISource> plain = m_plain->tryCreateSource(uri, kSource, true, &params);
        const auto unprepared = peru::make<CEncapsulatedSource>(m_context, m_name, uri, kSource, &params);
        EXPECT_EQ(describe(P<ISource>(unprepared)),
                  "0 0 0 0 " + text(uri->getAsString()) + " sonora2_faulty 0 0 0 0 0 0 0 0 0 0 0 -1 ");
        const P<ISource> source = m_boxed->tryCreateSource(uri, kSource, false, &params);
        EXPECT_EQ(m_calls->take(), "create 3 1 800;create 3 1 800;close;");
        apply(source);
        const std::string applied = m_calls->take();
        apply(plain);
        EXPECT_EQ(applied, m_calls->take());
        plain->open();
        m_calls->take();
        source->open();
        EXPECT_EQ(m_calls->take(), replayed);
        EXPECT_TRUE(waitUntil([&] { return source->getBufferStatus() == (prefetched ? 97 : 100); }))
            << "pictures fetched ahead";
        EXPECT_EQ(describe(source), describe(plain));
        for (const double time : {0.0, 0.5, 1.25, -1.0}) {
            for (const auto& both : {source, plain})
                time > 0.0 ? both->skipToTime(time) : time < 0.0 ? both->setStartTime(0.25) : void();
            EXPECT_EQ(readPictures(source), readPictures(plain)) << time;
            EXPECT_EQ(describe(source), describe(plain));
        }
        source->close();
        m_calls->take();
        source->open();
        EXPECT_EQ(m_calls->take(), replayed) << "after it was closed";
        source->open();
        EXPECT_EQ(m_calls->take(), "open;") << "once more";
        endChildren(SIGKILL);
        for (int i = 0; i < 2; ++i) // the reason stays the same
            EXPECT_THAT(messageOf([&] { source->skipToTime(0.5); }),
                        testing::ContainsRegex("sonora2_faulty.*movie\\.faulty.*signal 9"));
        source->close();
        EXPECT_FALSE(interfaceCast<IAudioSource>(source)->getNextAudioChunk());
        EXPECT_TRUE(source->getDuration() == 0.0 && !source->isEOF() && !source->isOpened());
        source->open();
        EXPECT_EQ(m_calls->take(), "create 3 1 800;" + replayed) << "in another slave";
    }
}

// A change in the middle of a run of chunks takes effect at the first one that the caller has not seen.
TEST_F(Transparency, SourceKeepsItsPositionWhenItChanges) {
    const P<ISource> source = makeSource("all.movie.faulty", 6000);
    const auto audio = interfaceCast<IAudioSource>(source);
    const std::pair<const char*, std::function<void()>> changes[] = {
        {"setAudioStream 2;", [&] { audio->setAudioStream(2); }},
        {"setSalvage 0;", [&] { interfaceCast<ISalvage>(source)->setSalvage(false); }},
        {"setClippingPrevention 0;",
         [&] { interfaceCast<IClippingPrevention>(source)->setClippingPrevention(false); }},
        {"setDeliveredFormat 1 2 3;",
         [&] { interfaceCast<IMediaDescription>(source)->setDeliveredFormat(1, 2, 3); }},
        {"useFloat 8;", [&] { interfaceCast<IFloatSamples>(source)->useFloat(8); }}};
    audio->open();
    EXPECT_EQ(m_calls->take(), "create 3 1 0;open;");
    double time = 0.0;
    for (const auto& [call, change] : changes) {
        for (int i = 0; i < 3; ++i, time += 0.3) {
            EXPECT_FALSE(source->isEOF());
            EXPECT_NEAR(audio->getNextAudioChunk()->getTimestamp(), time, 1e-9);
        }
        change();
        EXPECT_EQ(m_calls->take(), "skipToTime " + std::to_string(time) + ";" + call);
        change();
        EXPECT_EQ(m_calls->take(), call) << "nothing was read in between";
    }
    EXPECT_EQ(readAll(audio).size(), 6000u);
    EXPECT_TRUE(source->isEOF());
    EXPECT_EQ(m_calls->take(), "end;");
    for (int i = 0; i < 3; ++i) {
        i > 0 ? source->skipToTime(0.6) : source->setStartTime(0.1);
        for (const double expected : {i > 0 ? 0.6 : 0.0, i > 0 ? 0.9 : 0.3})
            EXPECT_NEAR(audio->getNextAudioChunk()->getTimestamp(), expected, 1e-9);
    }

    m_frames = 100;
    const P<ISource> sound = makeSource("x.faulty", 100);
    sound->open();
    P<IVideoSource>(sound)->setMaxSize(5, 5);
    EXPECT_THAT(describe(sound), testing::EndsWith(" sonora2_faulty 0 0 0 0 0 0 0 0 1000 2 2 7 "));
    EXPECT_FALSE(P<IVideoSource>(sound)->getNextPicture());
    EXPECT_TRUE(readAll(P<IAudioSource>(sound)) == makeExpected());
    EXPECT_TRUE(sound->isEOF());

    // A log that is too long loses its end, and says so.
    m_calls->take();
    makeSource("flood-log@create.faulty", 1);
    const std::string flood = m_calls->take();
    const auto lines = std::count(flood.begin(), flood.end(), 'x') / 1000;
    EXPECT_TRUE(lines > 100 && flood.ends_with(";1 " + std::to_string(20'000 - lines) +
                                               " more log entries of the plug-in were dropped.;"));
}

TEST_F(Transparency, FormatInASlaveIsLikeAnother) {
    auto params = CFakeFormat::takes(800, 3, 2);
    std::iota(std::begin(params.video), std::end(params.video), uint8_t{1});
    const auto target = m_out / "boxed.faulty";
    const auto picture = peru::make<CRGBPicture>(peru::make<peru::CMemoryManager>(), 0.75, 1, 1, false,
                                                 peru::make<peru::CMemoryBlock>(4));
    const auto plain = m_plain->tryCreateFormat(toURI(target), kFormat, true, &params);
    const auto makeFormat = [&](const std::filesystem::path& path) {
        return P<IAudioFormat>(m_boxed->tryCreateFormat(toURI(path), kFormat, true, &params));
    };
    const P<IFormat> format = makeFormat(target);
    EXPECT_EQ(m_calls->take(), "create 24 1 800;create 24 1 800;");
    const auto floats = interfaceCast<IFloatSamples>(format);
    EXPECT_EQ(interfaceCast<IFormatSettings>(format)->getUsedSettings(), 5u);
    EXPECT_TRUE(floats->canUseFloat(8) && !floats->canUseFloat(4));
    const auto run = [&](const P<IFormat>& tested, bool isComplete) {
        const P<IAudioFormat> audio(tested);
        std::string answers = describe(tested);
        audio->setAudioQuality(0.5);
        audio->setAudioBitRate(3, 1, 5);
        interfaceCast<IFloatSamples>(tested)->useFloat(8);
        tested->open();
        answers += describe(tested);
        audio->writeAudioChunk(m_chunk);
        for (const auto& written : {picture, P<CRGBPicture>()}) P<IVideoFormat>(tested)->writeFrame(written);
        isComplete ? tested->close() : interfaceCast<IDiscardable>(tested)->discard();
        return answers + describe(tested) + (isComplete ? readFile(target) : "");
    };
    for (const bool isComplete : {true, false}) {
        const std::string expected = run(plain, isComplete), expectedCalls = m_calls->take();
        std::filesystem::remove(target);
        EXPECT_TRUE(run(format, isComplete) == expected);
        std::string calls = m_calls->take();
        // The first opening applies the settings once more.
        if (isComplete) calls.erase(0, calls.find("setAudioQuality", 1));
        if (isComplete) calls.insert(calls.find("open"), "useFloat 8;");
        EXPECT_EQ(calls, expectedCalls);
        EXPECT_EQ(std::filesystem::exists(target), isComplete);
        std::filesystem::remove(target);
    }
    const auto discardAfterDeath = [&] {
        endChildren(SIGKILL);
        interfaceCast<IDiscardable>(format)->discard();
        return !std::filesystem::exists(target);
    };
    format->open();
    endChildren(SIGKILL);
    for (int i = 0; i < 2; ++i) EXPECT_THROW(format->close(), CSonoraError);
    format->close();
    EXPECT_FALSE(format->isOpened() || interfaceCast<IFloatSamples>(format));
    EXPECT_EQ(P<IAudioFormat>(format)->getChannelCount(), 3);
    EXPECT_TRUE(discardAfterDeath());
    m_calls->take();
    format->open();
    EXPECT_EQ(m_calls->take(), "create 24 1 800;setAudioQuality 0.500000;setAudioBitRate 3 1 5;open;");
    format->close();
    EXPECT_FALSE(discardAfterDeath()) << "it was complete";
    std::filesystem::remove(target);
    format->open();
    std::filesystem::rename(m_out.write("another", ""), target);
    EXPECT_FALSE(discardAfterDeath()) << "not the format's";

    const auto probe = m_boxed->createFormatProbe(toURI(target));
    EXPECT_EQ(probe->ask(params), 5u);
    params.nChannelCount = 9;
    EXPECT_EQ(probe->ask(params), std::nullopt);
    EXPECT_FALSE(makeFormat(target));
    params.nChannelCount = 3;
    for (const auto& chunk : {m_chunk, P<sonora2::audio::IAudioChunk>()}) {
        const auto failing = makeFormat(m_out / "throw-own@writeAudioChunk.faulty");
        failing->open();
        EXPECT_THROW(failing->writeAudioChunk(chunk), CSonoraError) << "at once, as it is no whole frame";
    }
    EXPECT_THROW(makeFormat(m_out / "exit@opened.faulty")->open(), CSonoraError);
    EXPECT_FALSE(std::filesystem::exists(m_out / "exit@opened.faulty"));
    makeFormat(m_out / "left.faulty")->open(); // released while it is open
    EXPECT_THAT(m_calls->take(), testing::EndsWith("open;close;"));
}

// Also the procedures that this version's host does not call.
TEST_F(Transparency, EveryProcedureIsServed) {
    const ISonoraPlugin::SSourceParams any;
    const auto slave = peru::make<CSlaveHandler>(m_context, m_name, kSlaveNiceValue);
    const auto uri = toURI(m_media.write("all.movie.faulty", "1500"));
    const auto plain = m_plain->tryCreateSource(uri, kSource, true, &any);
    const auto source = slave->getClient()->tryCreateSource(uri, kSource, true, &any);
    for (const auto& both : {source, plain}) both->setStartTime(0.5);
    for (int i = 0; i < 2; ++i, source->open(), plain->open())
        EXPECT_THAT(describe(plain), testing::StartsWith(describe(source)));
    EXPECT_EQ(bytesOf(P<IAudioSource>(source)->getNextAudioChunk()),
              bytesOf(P<IAudioSource>(plain)->getNextAudioChunk()));
    EXPECT_EQ(readAll(P<IAudioSource>(source)).size(), 4800u);
    EXPECT_TRUE(source->isEOF());
    EXPECT_THAT(text(P<CSourceClient>(source)->getLog()), HasSubstr("open"));

    const auto writer = peru::make<CSlaveHandler>(m_context, m_name, kSlaveNiceValue);
    const auto params = CFakeFormat::takes(800, 3, 2);
    const auto target = toURI(m_out / "all.faulty");
    const auto format = writer->getClient()->tryCreateFormat(target, kAudioFormat, true, &params);
    EXPECT_EQ(describe(format), describe(m_plain->tryCreateFormat(target, kAudioFormat, true, &params)));
    format->open();
    EXPECT_THAT(text(P<CFormatClient>(format)->getLog()), HasSubstr("open"));
    EXPECT_TRUE(format->isOpened());
}

// The program is of no use to anybody but the library.
TEST_F(Transparency, SlaveRefusesOtherCallers) {
    const P<ISource> source = makeSource("x.faulty", 1);
    const std::string program =
        std::filesystem::read_symlink("/proc/" + std::to_string(listChildren().at(0)) + "/exe");
    const std::string log = m_temporary / "crash";
    const auto start = [&](size_t place, const std::string& value) {
        std::vector<std::string> arguments = {
            program, std::to_string(::getpid()), "no-pipe", "none", log, "4", "0", "1"};
        arguments.at(place) = value;
        return run(arguments);
    };
    EXPECT_EQ(start(4, log).exitCode, 1) << "there is no such pipe";
    for (const auto& [place, value] :
         {std::pair(1, ""), {1, "0"}, {1, "-1"}, {1, "12x"}, {5, "x"}, {7, "on"}}) {
        const SProcessResult result = start(static_cast<size_t>(place), value);
        EXPECT_EQ(result.exitCode, 2) << place << value;
        EXPECT_EQ(result.err.find("usage: sonora2_slave PARENT "), 0u);
    }
    EXPECT_EQ(run({program, "1", "no-pipe", "none", log, "4", "0"}).exitCode, 2);
    for (const char* content : {"", "a report"}) {
        m_temporary.write("crash", content);
        EXPECT_EQ(start(1, "2147483647").exitCode, 1) << "its host has ended";
        EXPECT_EQ(std::filesystem::exists(log), *content != '\0');
    }
}

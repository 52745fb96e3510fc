#include "isolation/BoxedFixture.h"
#include "isolation/plugin/Faults.h"

#include <gmock/gmock.h>

#include <cstdlib>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

namespace {

using namespace tests;
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

const SFault kCrashes[] = {
    {"null-write", kSegmentation}, {"stack-overflow", kSegmentation}, {"abort", kAbort},
    {"terminate", kAbort},         {"exit", "exit code 3"},           {"kill", "signal 9"},
};
const SFault kExceptions[] = {
    {"throw-std", "a mistake of the plug-in"},
    {"throw-own", "an error of the plug-in"},
    {"throw-int", "exception"},
};
constexpr const char* kReading[] = {
    "create", "open", "skipToTime", "getDuration", "getSampleRate", "getNextAudioChunk", "close"};
constexpr const char* kWriting[] = {
    "create", "setAudioQuality", "open", "getEstimatedSizeBytes", "writeAudioChunk", "close"};

constexpr const char* kSourceOperations[] = {"create",
                                             "isOpened",
                                             "open",
                                             "close",
                                             "skipToTime",
                                             "getDuration",
                                             "isEOF",
                                             "getBufferStatus",
                                             "setStartTime",
                                             "getStartTime",
                                             "setMaxSize",
                                             "getWidth",
                                             "getHeight",
                                             "getNextPicture",
                                             "getFrameRateNum",
                                             "peekNextPictureTimestamp",
                                             "getPixelAspectNum",
                                             "getPixelAspectDen",
                                             "getFrameRateDen",
                                             "getFrameDuration",
                                             "getAudioStreamInfos",
                                             "setAudioStream",
                                             "getNextAudioChunk",
                                             "getSampleRate",
                                             "getChannelCount",
                                             "getBytesPerSample"};
constexpr const char* kFormatOperations[] = {"create",
                                             "isOpened",
                                             "open",
                                             "close",
                                             "getEstimatedSizeBytes",
                                             "getVideoParameter",
                                             "writeFrame",
                                             "getWantedImageType",
                                             "getSampleRate",
                                             "getChannelCount",
                                             "getBytesPerSample",
                                             "setAudioQuality",
                                             "setAudioBitRate",
                                             "writeAudioChunk"};
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
template <size_t N, class Check> void forEachFault(const char* const (&operations)[N], const Check& check) {
    const bool isFull = std::getenv("TONEWRIGHT_TEST_ALL_FAULTS") != nullptr;
    size_t next = 0;
    for (const char* operation : operations)
        for (size_t i = 0; i < (isFull ? std::size(kFaults) : 1); ++i)
            check(kFaults[next++ % std::size(kFaults)], operation);
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
        else
            EXPECT_THAT(message, HasSubstr(fault.message));
        setDeadline(30'000);
        return message;
    }
};

} // namespace

TEST_F(Boxed, EveryCrashWhileReadingIsAnError) {
    for (const SFault& fault : kCrashes)
        EXPECT_THAT(decode(nameOf(fault, "getNextAudioChunk")), HasSubstr(fault.message)) << fault.name;
    for (const char* operation : kReading)
        EXPECT_THAT(decode(nameOf(kCrashes[4], operation)), HasSubstr("exit code 3")) << operation;
    expectHealthy();
}

TEST_F(Boxed, EveryCrashWhileWritingIsAnErrorAndLeavesNoFile) {
    for (const SFault& fault : kCrashes)
        EXPECT_THAT(encode(m_out / nameOf(fault, "writeAudioChunk")), HasSubstr(fault.message)) << fault.name;
    for (const char* operation : kWriting)
        EXPECT_THAT(encode(m_out / nameOf(kCrashes[4], operation)), HasSubstr("exit code 3")) << operation;
    EXPECT_EQ(countEntries(m_out.path()), 0u);
    const auto existing = m_out.write(nameOf(kCrashes[4], "close"), "old");
    EXPECT_THAT(encode(existing), HasSubstr("exit code 3"));
    EXPECT_EQ(readFile(existing), "old");
    EXPECT_EQ(countEntries(m_out.path()), 1u);
    expectHealthy();
}

TEST_F(Boxed, ExceptionsCrossWithTheirText) {
    for (const SFault& fault : kExceptions) {
        for (const char* operation : kReading)
            EXPECT_THAT(decode(nameOf(fault, operation)), HasSubstr(fault.message))
                << fault.name << operation;
        for (const char* operation : kWriting)
            EXPECT_THAT(encode(m_out / nameOf(fault, operation)), HasSubstr(fault.message))
                << fault.name << operation;
    }
    EXPECT_EQ(countEntries(m_out.path()), 0u);
    expectHealthy();
}

TEST_F(Boxed, HangsEndAtTheDeadline) {
    setDeadline(1'000);
    EXPECT_THAT(decode("hang@getNextAudioChunk.faulty"), kIsTimeout);
    setDeadline(200); // of which closing has ten
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

TEST_F(Boxed, MemoryIsLimited) {
#ifdef TONEWRIGHT_SANITIZED
    GTEST_SKIP() << "sanitizers reserve more memory than any limit";
#endif
    setMemory(128);
    EXPECT_THAT(decode("allocate@open.faulty"), HasSubstr("bad_alloc"));
    EXPECT_THAT(encode(m_out / "allocate@writeAudioChunk.faulty"), HasSubstr("bad_alloc"));
    EXPECT_EQ(countEntries(m_out.path()), 0u);
    expectHealthy();
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

TEST_F(Boxed, AFloodOfLogLinesDoesNotDrownTheHost) {
    EXPECT_EQ(decode("flood-log@getNextAudioChunk.faulty"), "");
    expectHealthy();
}

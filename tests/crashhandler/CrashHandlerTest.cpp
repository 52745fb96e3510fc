#include "support/Process.h"
#include "support/TempFolder.h"

#include <cstring>
#include <map>
#include <regex>
#include <sstream>
#include <sys/stat.h>

namespace {

using namespace tests;

// Reads a minidump through its directory, as a debugger does.
class CDump {
public:
    explicit CDump(std::string bytes) : m_bytes(std::move(bytes)) {
        if (m_bytes.substr(0, 4) != "MDMP") return;
        for (uint32_t i = 0; i < at<uint32_t>(8); ++i) {
            const uint32_t entry = at<uint32_t>(12) + i * 12;
            m_streams[at<uint32_t>(entry)] = {at<uint32_t>(entry + 8), at<uint32_t>(entry + 4)};
        }
    }
    template <class T> T at(size_t position) const {
        T value{};
        if (position + sizeof value <= m_bytes.size())
            std::memcpy(&value, m_bytes.data() + position, sizeof value);
        return value;
    }
    bool has(uint32_t type) const { return m_streams.count(type) && m_streams.at(type).second > 0; }
    uint32_t position(uint32_t type) const { return m_streams.at(type).first; }
    std::string text(uint32_t type) const {
        return m_bytes.substr(m_streams.at(type).first, m_streams.at(type).second);
    }
    const std::string& bytes() const { return m_bytes; }

private:
    std::string m_bytes;
    std::map<uint32_t, std::pair<uint32_t, uint32_t>> m_streams;
};

constexpr uint32_t kThreads = 3, kModules = 4, kMemory = 5, kException = 6, kSystem = 7, kMaps = 0x47670009;

} // namespace

TEST(CrashHandler, LeavesReportAndDumpForEveryKindOfCrash) {
    const struct {
        const char* kind;
        int signal;
        const char* inReport;
        uint32_t threads = 2;
    } cases[] = {{"segv", SIGSEGV, "Signal: SIGSEGV"},
                 {"abort", SIGABRT, "Signal: SIGABRT"},
                 {"overflow", SIGSEGV, "Signal: SIGSEGV"},
                 {"thread overflow", SIGSEGV, "Signal: SIGSEGV", 3},
                 {"loading", SIGSEGV, "Signal: SIGSEGV", 3}, // while another thread loads a library
                 {"together", SIGSEGV, "Signal: SIGSEGV", 10},
                 {"unloaded", SIGSEGV, "Signal: SIGSEGV"}, // after the host has closed the library
                 {"throw", SIGABRT, "Exception: std::runtime_error: nobody catches this"}};
    for (const auto& test : cases) {
        SCOPED_TRACE(test.kind);
        CTempFolder folder;
        const SProcessResult result = run({CRASHING_PROGRAM, test.kind, folder.path()});
        EXPECT_EQ(result.exitCode, 128 + test.signal); // the crash must not be hidden

        const std::string report = readFile(folder / "report.txt");
        EXPECT_EQ(report.find("Crashing 1.0\n"), 0u);
        EXPECT_NE(report.find(test.inReport), std::string::npos) << report;
        std::istringstream frames(report.substr(report.find("innermost first:\n") + 17));
        std::string ofProgram;
        for (std::string line; std::getline(frames, line) && !line.empty();) {
            EXPECT_TRUE(std::regex_match(line, std::regex("0x[0-9a-f]+( [^ ]+\\+0x[0-9a-f]+)?"))) << line;
            if (line.find("/crashing+0x") != std::string::npos) ofProgram = line;
        }
        EXPECT_NE(ofProgram, "") << report;
        EXPECT_NE(report.find("[stack]"), std::string::npos) << report; // near the end of the modules

        const CDump dump(readFile(folder / "dump.dmp"));
        for (uint32_t stream : {kThreads, kModules, kMemory, kException, kSystem, kMaps})
            ASSERT_TRUE(dump.has(stream)) << stream;
        EXPECT_EQ(dump.at<uint32_t>(dump.position(kException) + 8), static_cast<uint32_t>(test.signal));
        EXPECT_EQ(dump.at<uint32_t>(dump.position(kThreads)), test.threads);
        EXPECT_GE(dump.at<uint32_t>(dump.position(kMemory)), 2u); // both stacks
        EXPECT_NE(dump.text(kMaps).find("libc.so"), std::string::npos);
    }
}

TEST(CrashHandler, KeepsTheEnvironmentToItself) {
    CTempFolder folder;
    run({CRASHING_PROGRAM, "segv", folder.path()}, {}, {{"SECRET_TOKEN", "hunter2-hunter2"}});
    const CDump dump(readFile(folder / "dump.dmp"));
    ASSERT_TRUE(dump.has(kThreads));
    EXPECT_EQ(dump.bytes().find("hunter2-hunter2"), std::string::npos);
}

TEST(CrashHandler, LetsAHostRecoverWithAllItsThreads) {
    CTempFolder folder;
    EXPECT_EQ(run({CRASHING_PROGRAM, "recover", folder.path()}).exitCode, 77);
    EXPECT_TRUE(CDump(readFile(folder / "dump.dmp")).has(kException));
}

TEST(CrashHandler, WritesOnlyPrivateFilesAndWaitsForNoReader) {
    namespace fs = std::filesystem;
    CTempFolder folder;
    fs::permissions(folder.write("report.txt", "old"), fs::perms(0666));
    ASSERT_EQ(::mkfifo((folder / "dump.dmp").c_str(), 0600), 0);
    run({CRASHING_PROGRAM, "segv", folder.path()});
    EXPECT_EQ(fs::status(folder / "report.txt").permissions(), fs::perms(0600));
    EXPECT_EQ(readFile(folder / "report.txt").find("Crashing 1.0\n"), 0u);
    EXPECT_TRUE(fs::is_fifo(folder / "dump.dmp"));
}

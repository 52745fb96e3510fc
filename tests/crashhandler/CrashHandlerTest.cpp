#include "support/Process.h"
#include "support/TempFolder.h"

#include <cstring>
#include <ctime>
#include <iomanip>
#include <map>
#include <regex>
#include <set>
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
    std::string text(uint32_t location, uint32_t size) const { return m_bytes.substr(location, size); }
    const std::string& bytes() const { return m_bytes; }

private:
    std::string m_bytes;
    std::map<uint32_t, std::pair<uint32_t, uint32_t>> m_streams;
};

constexpr uint32_t kThreads = 3, kModules = 4, kMemory = 5, kException = 6, kSystem = 7, kStatus = 0x47670004,
                   kMaps = 0x47670009;

// Numbers, stack and modules of a crash in the program's function for it.
void expectDetails(const CDump& dump, const std::string& report) {
    const auto number = [&](const std::string& label) {
        return std::stoull(report.substr(report.find(label) + label.size()), nullptr, 0);
    };
    EXPECT_NE(report.find(", code 1, address 0x10\n"), std::string::npos) << report;
    EXPECT_LT(std::time(nullptr) - static_cast<int64_t>(number("Time: ")), 60);
    const uint32_t exception = dump.position(kException), thread = dump.position(kThreads) + 4;
    for (const uint32_t id : {exception, thread}) EXPECT_EQ(dump.at<uint32_t>(id), number("\nThread: "));
    EXPECT_EQ(dump.at<uint32_t>(exception + 12), 1u); // code
    EXPECT_EQ(dump.at<uint64_t>(exception + 24), 16u);
    EXPECT_EQ(dump.text(exception + 160, 8), dump.text(thread + 40, 8)); // its registers
    EXPECT_NE(dump.text(kStatus).find("\nPid:\t" + std::to_string(number("Process: ")) + "\n"),
              std::string::npos);
    EXPECT_EQ(dump.position(kStatus) + dump.text(kStatus).size(), dump.position(kMaps));

    const uint32_t context = dump.at<uint32_t>(thread + 44), size = dump.at<uint32_t>(thread + 32);
    EXPECT_EQ(dump.at<uint16_t>(context + 56), 0x33u); // the code segment of 64-bit programs
    EXPECT_EQ(dump.at<uint16_t>(context + 66), 0x2bu);
    EXPECT_EQ(dump.at<uint32_t>(context + 52), dump.at<uint32_t>(context + 256 + 24)); // mxcsr
    const uint64_t stack = dump.at<uint64_t>(thread + 24), pointer = dump.at<uint64_t>(context + 152);
    EXPECT_TRUE(stack <= pointer - 128 && pointer < stack + size);
    EXPECT_NE(dump.text(dump.at<uint32_t>(thread + 36), size).find("on the crashing stack"),
              std::string::npos);
    EXPECT_EQ(dump.text(kMemory).substr(4, 16), dump.text(thread + 24, 16));

    const SProcessResult peer = run({"readelf", "-n", CRASHING_PROGRAM});
    const std::string maps = '\n' + dump.text(kMaps);
    std::set<std::string> names;
    for (uint32_t i = 0; i < dump.at<uint32_t>(dump.position(kModules)); ++i) {
        const uint32_t module = dump.position(kModules) + 4 + 108 * i, name = dump.at<uint32_t>(module + 20);
        std::string path;
        for (uint32_t at = 0; at < dump.at<uint32_t>(name); at += 2)
            path += static_cast<char>(dump.at<uint16_t>(name + 4 + at));
        EXPECT_TRUE(names.insert(path).second) << path;
        const uint64_t start = dump.at<uint64_t>(module), end = start + dump.at<uint32_t>(module + 8);
        std::ostringstream first, last, id; // of its lines in the memory map
        first << '\n' << std::hex << start << '-';
        last << '-' << std::hex << end << ' ';
        const size_t line = maps.find(first.str()), lastLine = maps.rfind('\n', maps.rfind(path + '\n'));
        ASSERT_NE(line, std::string::npos) << path;
        EXPECT_EQ(maps.substr(maps.find('\n', line + 1) - path.size(), path.size()), path);
        EXPECT_NE(maps.find(last.str(), lastLine), std::string::npos) << path;
        const uint32_t view = dump.at<uint32_t>(module + 80);
        for (const char byte : dump.text(view + 4, dump.at<uint32_t>(module + 76) - 4))
            id << std::hex << std::setw(2) << std::setfill('0') << int{static_cast<uint8_t>(byte)};
        EXPECT_TRUE(path != CRASHING_PROGRAM || peer.out.find("ID: " + id.str() + '\n') != std::string::npos);
    }
    EXPECT_TRUE(names.count(CRASHING_PROGRAM));
}

} // namespace

TEST(CrashHandler, LeavesReportAndDumpForEveryKindOfCrash) {
    const struct {
        const char* kind;
        int signal;
        const char* inReport;
        uint32_t threads = 2;
        uint32_t stack = 1;    // least bytes of the crashing thread's
        bool recovers = false; // the host goes on, with all its threads
    } cases[] = {{"segv", SIGSEGV, "Signal: SIGSEGV, code 1,"},
                 {"abort", SIGABRT, "Signal: SIGABRT, code -6,"},
                 {"kill 11", SIGSEGV, "Signal: SIGSEGV, code 0,"},
                 {"kill 4", SIGILL, "Signal: SIGILL, code 0,"},
                 {"kill 31", SIGSYS, "Signal: SIGSYS, code 0,"},
                 {"overflow", SIGSEGV, "Signal: SIGSEGV", 2, 200'000},
                 {"thread overflow", SIGSEGV, "Signal: SIGSEGV", 3, 200'000},
                 {"loading", SIGSEGV, "Signal: SIGSEGV", 3}, // while another thread loads a library
                 {"together", SIGSEGV, "Signal: SIGSEGV", 10},
                 {"recover", SIGSEGV, "Signal: SIGSEGV", 2, 1, true},
                 {"unloaded", SIGSEGV, "Signal: SIGSEGV"}, // after the host has closed the library
                 {"throw", SIGABRT, "Exception: std::runtime_error: nobody catches this"}};
    for (const auto& test : cases) {
        SCOPED_TRACE(test.kind);
        CTempFolder folder;
        const SProcessResult result =
            run({CRASHING_PROGRAM, test.kind, folder.path()}, {}, {{"SECRET_TOKEN", "hunter2-hunter2"}});
        EXPECT_EQ(result.exitCode, test.recovers ? 77 : 128 + test.signal); // the crash must not be hidden

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
        EXPECT_GE(dump.at<uint32_t>(dump.position(kThreads) + 36), test.stack);
        if (test.kind == std::string("segv")) expectDetails(dump, report);
        EXPECT_EQ(result.err.find("terminated") == 0, test.kind == std::string("throw"));
        for (const auto& [list, recordSize] : {std::pair(kThreads, 48u), {kModules, 108u}, {kMemory, 16u}}) {
            const uint32_t count = dump.at<uint32_t>(dump.position(list));
            EXPECT_GE(count, 2u) << list; // the program and a library, the stacks of both threads
            EXPECT_EQ(dump.text(list).size(), 4 + count * recordSize) << list;
        }
        EXPECT_NE(dump.text(kMaps).find("libc.so"), std::string::npos);
        EXPECT_EQ(dump.bytes().find("hunter2-hunter2"), std::string::npos); // of the environment
    }
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

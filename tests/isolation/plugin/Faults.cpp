#include "isolation/plugin/Faults.h"

#include "sonora2/context/SonoraError.h"

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <functional>
#include <limits>
#include <map>
#include <stdexcept>
#include <sys/ptrace.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace faulty {

namespace {

std::string getVictim(const char* variable) {
    const char* value = std::getenv(variable);
    return value ? value : "";
}

void report(const char* attempt, bool hasFailed) {
    const std::string outcome = hasFailed ? std::string("refused: ") + std::strerror(errno) : "SUCCEEDED";
    throw sonora2::common::CSonoraError((std::string(attempt) + " " + outcome).c_str());
}

void writeToNull() {
    volatile int* volatile nowhere = nullptr;
    *nowhere = 1;
}

// Not a tail call, and each frame is used after the inner call.
int overflow(int depth) {
    volatile char frame[4096];
    frame[depth % 4096] = static_cast<char>(depth);
    return depth < std::numeric_limits<int>::max() ? overflow(depth + 1) + frame[depth % 4096] : 0;
}

void allocate() {
    constexpr size_t kStep = 16 << 20;
    for (std::vector<std::vector<char>> blocks;;) blocks.emplace_back(kStep, 'x');
}

// Writes into everything that is open, such as the connection to the host.
void writeToSockets(const std::string& bytes) {
    for (int file = 3; file < 64; ++file) {
        struct stat status {};
        if (::fstat(file, &status) == 0 && S_ISSOCK(status.st_mode))
            static_cast<void>(::send(file, bytes.data(), bytes.size(), MSG_NOSIGNAL | MSG_DONTWAIT));
    }
}

// The answer to a request for sound, with a text in it that is said to be very long.
std::string makeLongAnswer() {
    using namespace std::string_literals;
    return "\6\0\0\0return\6\0\0\0Result\0"s + "\0\0\0\0\0"s + std::string(8, '\0') + "\xff\xff\xff\x7f" +
           std::string(100'000, 'x');
}

// The caller of vfork waits like one that waits for a disk.
void waitForDevice() {
    if (::vfork() != 0) return;
    ::usleep(1'500'000);
    ::_exit(0);
}

void closeAll() {
    for (int file = 3; file < 64; ++file) ::close(file);
}

void failOnAThread() {
    std::thread([] { throw std::runtime_error("nobody catches this"); }).join();
}

void connectOut() {
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    getVictim(kVictimSocket).copy(address.sun_path, sizeof address.sun_path - 1);
    const int file = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    report("connect",
           file < 0 || ::connect(file, reinterpret_cast<sockaddr*>(&address), sizeof address) != 0);
}

void execute() {
    const std::string text = "echo executed > '" + getVictim(kVictimFile) + "'";
    const char* const arguments[] = {"sh", "-c", text.c_str(), nullptr};
    ::execv("/bin/sh", const_cast<char**>(arguments));
    report("exec", true);
}

const std::map<std::string, std::function<void()>> kFaults = {
    {"null-write", writeToNull},
    {"stack-overflow", [] { overflow(0); }},
    {"abort", [] { std::abort(); }},
    {"exit", [] { ::_exit(3); }},
    {"kill", [] { ::kill(::getpid(), SIGKILL); }},
    {"throw-std", [] { throw std::logic_error("a mistake of the plug-in"); }},
    {"throw-int", [] { throw 42; }},
    {"throw-own", [] { throw sonora2::common::CSonoraError("an error of the plug-in"); }},
    {"terminate", failOnAThread},
    {"hang",
     [] {
         for (;;) ::pause();
     }},
    {"pause", [] { ::usleep(600'000); }},
    {"wait-for-device", waitForDevice},
    {"allocate", allocate},
    {"garbage", [] { writeToSockets(std::string(100'000, '\xff')); }},
    {"long-answer", [] { writeToSockets(makeLongAnswer()); }},
    {"close-all", closeAll},
    {"read-outside", [] { report("read", ::open(getVictim(kVictimFile).c_str(), O_RDONLY) < 0); }},
    {"write-outside",
     [] { report("write", ::open(getVictim(kVictimFile).c_str(), O_WRONLY | O_TRUNC) < 0); }},
    {"connect", connectOut},
    {"exec", execute},
    {"fork", [] { report("fork", ::fork() < 0); }},
    {"signal-parent", [] { report("signal", ::kill(::getppid(), SIGKILL) != 0); }},
    {"trace-parent", [] { report("trace", ::ptrace(PTRACE_SEIZE, ::getppid(), 0, 0) != 0); }},
};

} // namespace

void commit(const std::string& fault) {
    if (const auto found = kFaults.find(fault); found != kFaults.end()) found->second();
}

} // namespace faulty

#include "crashhandler/CrashHandler.h"

#include "crashhandler/Mappings.h"
#include "crashhandler/MiniDump.h"
#include "crashhandler/SafeWriter.h"
#include "crashhandler/Threads.h"
#include "peru/threads/AlternateStack.h"

#include <atomic>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <cxxabi.h>
#include <exception>
#include <execinfo.h>
#include <fstream>
#include <limits>
#include <sstream>
#include <string>
#include <sys/syscall.h>
#include <unistd.h>

namespace crashhandler {

namespace {

constexpr int kSignals[] = {SIGSEGV, SIGBUS, SIGILL, SIGFPE, SIGABRT, SIGSYS, SIGTRAP};
constexpr const char* kSignalNames[] = {"SIGSEGV", "SIGBUS", "SIGILL", "SIGFPE",
                                        "SIGABRT", "SIGSYS", "SIGTRAP"};
constexpr size_t kSignalCount = std::size(kSignals);
constexpr size_t kMaxThreads = 256;

// Filled at installation, so that the handler only reads it.
struct SInstalled {
    char application[256] = {};
    char report[4096] = {};
    char dump[4096] = {};
    int reportFile = -1;
    const char* details = nullptr;
    bool modules = true;
    struct sigaction previous[kSignalCount] = {};
    std::terminate_handler previousTerminate = nullptr;
    uintptr_t stackLimit = std::numeric_limits<uintptr_t>::max();
};

SInstalled g_installed;
std::atomic<bool> g_isInstalled{false};
std::atomic<pid_t> g_crashed{0};     // the thread that writes the files
std::atomic<bool> g_finished{false}; // the files are complete
char g_exception[1024] = {};
SThreadState g_threads[kMaxThreads];

void copyText(char* target, size_t size, const char* text, const char* suffix = "") {
    const size_t room = size - std::strlen(suffix) - 1;
    std::strncpy(target, text ? text : "", room);
    target[room] = '\0';
    std::strcat(target, suffix);
}

// Records the exception; the abort that follows writes the files.
void onTerminate() {
    if (const std::type_info* type = abi::__cxa_current_exception_type()) {
        const char* text = "";
        std::string description;
        try {
            throw;
        } catch (const std::exception& exception) {
            description = exception.what();
            text = description.c_str();
        } catch (...) {
        }
        int status = -1;
        char* name = abi::__cxa_demangle(type->name(), nullptr, nullptr, &status);
        copyText(g_exception, sizeof g_exception, status == 0 ? name : type->name());
        std::strncat(g_exception, ": ", sizeof g_exception - std::strlen(g_exception) - 1);
        std::strncat(g_exception, text, sizeof g_exception - std::strlen(g_exception) - 1);
        std::free(name);
    }
    if (g_installed.previousTerminate) g_installed.previousTerminate();
    std::abort();
}

// The address and its place in the module's file. Names of functions would need the loader's lock, which
// another thread may hold.
void writeFrame(CSafeWriter& out, uintptr_t address) {
    out.text("0x");
    out.number(address, 16);
    forEachMapping([&](const SMapping& mapping) {
        if (address < mapping.start || address >= mapping.end || !mapping.path[0]) return;
        out.text(" ");
        out.text(mapping.path);
        out.text("+0x");
        out.number(address - mapping.start + mapping.offset, 16);
    });
    out.text("\n");
}

void writeReport(CSafeWriter& out, size_t signalIndex, const siginfo_t& signal, size_t threadCount) {
    out.text(g_installed.application);
    if (g_installed.details) {
        out.text("\n");
        out.text(g_installed.details);
    }
    out.text("\n\nTime: ");
    out.number(static_cast<uint64_t>(std::time(nullptr)));
    out.text(" s since 1970 UTC\nProcess: ");
    out.number(static_cast<uint64_t>(::getpid()));
    out.text("\nThread: ");
    out.number(static_cast<uint64_t>(g_threads[0].id));
    out.text(" of ");
    out.number(threadCount);
    out.text("\nSignal: ");
    out.text(kSignalNames[signalIndex]);
    out.text(signal.si_code < 0 ? ", code -" : ", code "); // below 0 if a process has sent it
    out.number(static_cast<uint64_t>(signal.si_code < 0 ? -signal.si_code : signal.si_code));
    out.text(", address 0x");
    out.number(reinterpret_cast<uintptr_t>(signal.si_addr), 16);
    if (g_exception[0]) {
        out.text("\nException: ");
        out.text(g_exception);
    }
    out.text("\n\nCalls, innermost first:\n");
    void* frames[128];
    const int count = ::backtrace(frames, std::size(frames));
    for (int i = 0; i < count; ++i) writeFrame(out, reinterpret_cast<uintptr_t>(frames[i]));
    if (!g_installed.modules) return;
    out.text("\nModules:\n");
    out.writeFile("/proc/self/maps");
}

size_t getIndex(int signal) {
    size_t index = 0;
    while (index + 1 < kSignalCount && kSignals[index] != signal) ++index;
    return index;
}

void endProcess(int signal) {
    std::signal(signal, SIG_DFL);
    sigset_t set;
    sigemptyset(&set);
    sigaddset(&set, signal);
    ::pthread_sigmask(SIG_UNBLOCK, &set, nullptr);
    ::raise(signal);
}

// Ends the process if writing takes too long, such as on a file system that does not respond.
class CWatchdog {
public:
    explicit CWatchdog(int signal) {
        s_signal = signal;
        struct sigaction action = {};
        action.sa_handler = [](int) { endProcess(s_signal); };
        action.sa_flags = SA_ONSTACK;
        ::sigaction(SIGALRM, &action, &m_action);
        sigset_t set;
        sigemptyset(&set);
        sigaddset(&set, SIGALRM);
        ::pthread_sigmask(SIG_UNBLOCK, &set, &m_mask);
        m_alarm = ::alarm(kLongestTime);
    }
    ~CWatchdog() {
        ::alarm(0);
        ::pthread_sigmask(SIG_SETMASK, &m_mask, nullptr);
        ::sigaction(SIGALRM, &m_action, nullptr);
        ::alarm(m_alarm);
    }
    CWatchdog(const CWatchdog&) = delete;
    CWatchdog& operator=(const CWatchdog&) = delete;

private:
    static constexpr unsigned kLongestTime = 30; // seconds
    static inline int s_signal = 0;

    struct sigaction m_action = {};
    sigset_t m_mask = {};
    unsigned m_alarm = 0;
};

// From here on crashes are the previous handlers' affair.
void finish() {
    ::alarm(0);
    for (size_t i = 0; i < kSignalCount; ++i) ::sigaction(kSignals[i], &g_installed.previous[i], nullptr);
    g_finished = true;
    releaseThreads();
}

void writeFiles(int number, const siginfo_t& signal, const ucontext_t& context) {
    const CWatchdog watchdog(number);
    const size_t threads = captureThreads(context, g_threads, kMaxThreads);
    // The report first: it is small, and says most if the dump cannot be finished.
    if (g_installed.reportFile >= 0) {
        CSafeWriter report(g_installed.reportFile);
        writeReport(report, getIndex(number), signal, threads);
    } else {
        CSafeWriter report(g_installed.report);
        writeReport(report, getIndex(number), signal, threads);
    }
    if (g_installed.dump[0]) {
        CSafeWriter dump(g_installed.dump);
        writeMiniDump(dump, signal, g_threads, threads, g_installed.stackLimit);
    }
    finish();
}

void onSignal(int number, siginfo_t* signal, void* context) {
    const pid_t self = static_cast<pid_t>(::syscall(SYS_gettid));
    pid_t writer = 0;
    if (g_crashed.compare_exchange_strong(writer, self)) {
        writeFiles(number, *signal, *static_cast<ucontext_t*>(context));
    } else if (writer == self && !g_finished) {
        finish(); // a crash while writing
    } else {
        // A second thread has crashed; the files of the first one come first.
        const timespec pause{0, 1'000'000};
        while (!g_finished) ::nanosleep(&pause, nullptr);
    }
    const struct sigaction& previous = g_installed.previous[getIndex(number)];
    if (previous.sa_flags & SA_SIGINFO)
        previous.sa_sigaction(number, signal, context);
    else if (previous.sa_handler != SIG_DFL && previous.sa_handler != SIG_IGN)
        previous.sa_handler(number);
    else
        ::raise(number); // delivered with the default action once this handler returns
}

// The address on the main thread's stack at which the arguments and the environment begin.
uintptr_t findStackStart() {
    std::ifstream file("/proc/self/stat");
    std::string text((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    const size_t afterName = text.rfind(')');
    if (afterName == std::string::npos) return std::numeric_limits<uintptr_t>::max();
    std::istringstream fields(text.substr(afterName + 2));
    std::string skipped;
    constexpr int kFieldsBeforeStartOfStack = 25; // the 28th field; the name was the second
    for (int i = 0; i < kFieldsBeforeStartOfStack; ++i) fields >> skipped;
    uintptr_t start = 0;
    fields >> start;
    return start ? start : std::numeric_limits<uintptr_t>::max();
}

} // namespace

void useAlternateStack() {
    if (g_isInstalled) peru::CAlternateStack::useForCurrentThread();
}

void install(const SNames& names) {
    copyText(g_installed.application, sizeof g_installed.application, names.application);
    copyText(g_installed.report, sizeof g_installed.report, names.report);
    copyText(g_installed.dump, sizeof g_installed.dump, names.dump, names.dump ? ".dmp" : "");
    g_installed.reportFile = names.reportFile;
    g_installed.details = names.details;
    g_installed.modules = names.modules;
    if (g_isInstalled) return;
    g_isInstalled = true;

    g_installed.stackLimit = findStackStart();
    void* frame = nullptr;
    ::backtrace(&frame, 1); // loads its library now rather than in the handler
    useAlternateStack();
    g_installed.previousTerminate = std::set_terminate(onTerminate);
    struct sigaction action = {};
    action.sa_sigaction = onSignal;
    action.sa_flags = SA_SIGINFO | SA_ONSTACK;
    for (size_t i = 0; i < kSignalCount; ++i) {
        action.sa_mask = {};
        ::sigaction(kSignals[i], &action, &g_installed.previous[i]);
    }
}

} // namespace crashhandler

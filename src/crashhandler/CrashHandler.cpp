#include "crashhandler/CrashHandler.h"

#include "crashhandler/MiniDump.h"
#include "crashhandler/SafeWriter.h"
#include "crashhandler/Threads.h"

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
#include <sys/mman.h>
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
    struct sigaction previous[kSignalCount] = {};
    std::terminate_handler previousTerminate = nullptr;
    uintptr_t stackLimit = std::numeric_limits<uintptr_t>::max();
};

SInstalled g_installed;
bool g_isInstalled = false;
std::atomic_flag g_crashed = ATOMIC_FLAG_INIT;
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

void writeReport(size_t signalIndex, const siginfo_t& signal, size_t threadCount) {
    CSafeWriter out(g_installed.report);
    out.text(g_installed.application);
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
    out.text(", code ");
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
    if (out.isGood()) ::backtrace_symbols_fd(frames, count, out.getFile());
    ::lseek(out.getFile(), 0, SEEK_END);
    out.text("\nModules:\n");
    out.writeFile("/proc/self/maps");
}

void onSignal(int number, siginfo_t* signal, void* context) {
    size_t index = 0;
    while (index + 1 < kSignalCount && kSignals[index] != number) ++index;

    // A second crash, in another thread or in here, goes straight to the old handler.
    if (!g_crashed.test_and_set()) {
        const size_t threads = captureThreads(*static_cast<ucontext_t*>(context), g_threads, kMaxThreads);
        {
            CSafeWriter dump(g_installed.dump);
            writeMiniDump(dump, *signal, g_threads, threads, g_installed.stackLimit);
        }
        writeReport(index, *signal, threads);
    }
    for (size_t i = 0; i < kSignalCount; ++i) ::sigaction(kSignals[i], &g_installed.previous[i], nullptr);
    const struct sigaction& previous = g_installed.previous[index];
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

void useAlternateStack() {
    constexpr size_t kSize = 128 * 1024;
    stack_t current = {};
    if (::sigaltstack(nullptr, &current) == 0 && !(current.ss_flags & SS_DISABLE) && current.ss_size >= kSize)
        return;
    void* memory =
        ::mmap(nullptr, kSize, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_STACK, -1, 0);
    if (memory == MAP_FAILED) return;
    stack_t stack = {};
    stack.ss_sp = memory;
    stack.ss_size = kSize;
    ::sigaltstack(&stack, nullptr);
}

} // namespace

void install(const SNames& names) {
    copyText(g_installed.application, sizeof g_installed.application, names.application);
    copyText(g_installed.report, sizeof g_installed.report, names.report);
    copyText(g_installed.dump, sizeof g_installed.dump, names.dump, ".dmp");
    if (g_isInstalled) return;
    g_isInstalled = true;

    g_installed.stackLimit = findStackStart();
    void* frame = nullptr;
    ::backtrace(&frame, 1); // loads its library now rather than in the handler
    useAlternateStack();    // lets the handler run after a stack overflow of the calling thread
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

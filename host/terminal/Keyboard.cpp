#include "terminal/Keyboard.h"

#include "base/Cancel.h"

#include <array>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <poll.h>
#include <string>
#include <termios.h>
#include <unistd.h>

namespace host {

namespace {

constexpr char kEscape = '\x1b';
constexpr int kSequenceMilliseconds = 100; // between the bytes of one key
constexpr size_t kLongestSequence = 8;

// What terminals send after an escape character.
constexpr struct {
    const char* sequence;
    int key;
} kSequences[] = {{"[C", kKeyRight},       {"OC", kKeyRight}, {"[D", kKeyLeft},
                  {"OD", kKeyLeft},        {"[A", kKeyUp},    {"OA", kKeyUp},
                  {"[B", kKeyDown},        {"OB", kKeyDown},  {"[1;2C", kKeyShiftRight},
                  {"[1;2D", kKeyShiftLeft}};

constexpr std::array kSignals{SIGTSTP, SIGQUIT, SIGABRT, SIGSEGV, SIGBUS, SIGFPE, SIGILL};

termios g_mode = {};                      // the terminal's original mode
volatile std::sig_atomic_t g_isTaken = 0; // the terminal is in our mode
struct sigaction g_reactions[kSignals.size()];

// Changing the mode from the background would suspend the program.
bool isForeground() {
    return ::tcgetpgrp(STDIN_FILENO) == ::getpgrp();
}

void setMode(const termios& mode) {
    while (::tcsetattr(STDIN_FILENO, TCSANOW, &mode) != 0 && errno == EINTR) {
    }
}

void take() {
    if (g_isTaken || isCancelled() || !isForeground()) return;
    sigset_t all, old;
    sigfillset(&all);
    ::pthread_sigmask(SIG_SETMASK, &all, &old);
    if (::tcgetattr(STDIN_FILENO, &g_mode) == 0) {
        termios mode = g_mode;
        mode.c_lflag &= ~static_cast<tcflag_t>(ICANON | ECHO);
        mode.c_cc[VMIN] = 1;
        mode.c_cc[VTIME] = 0;
        setMode(mode);
        g_isTaken = 1;
    }
    ::pthread_sigmask(SIG_SETMASK, &old, nullptr);
}

// Async-signal-safe.
void giveBack() {
    if (!g_isTaken) return;
    g_isTaken = 0;
    if (isForeground()) setMode(g_mode);
}

// Restores the terminal and lets the signal take its original effect. If the program continues after that,
// the handler is installed again.
void onSignal(int signal) {
    const int error = errno;
    giveBack();
    size_t i = 0;
    while (kSignals[i] != signal) ++i;
    struct sigaction own;
    sigset_t only, old;
    sigemptyset(&only);
    sigaddset(&only, signal);
    ::sigaction(signal, &g_reactions[i], &own);
    ::raise(signal);
    ::pthread_sigmask(SIG_UNBLOCK, &only, &old);
    ::pthread_sigmask(SIG_SETMASK, &old, nullptr);
    ::sigaction(signal, &own, nullptr);
    errno = error;
}

} // namespace

CKeyboard::CKeyboard() {
    struct sigaction action = {};
    action.sa_handler = onSignal;
    sigemptyset(&action.sa_mask);
    for (size_t i = 0; i < kSignals.size(); ++i) {
        ::sigaction(kSignals[i], nullptr, &g_reactions[i]);
        if (g_reactions[i].sa_handler != SIG_IGN) ::sigaction(kSignals[i], &action, nullptr);
    }
    onCancel(giveBack);
    take();
}

CKeyboard::~CKeyboard() {
    onCancel(nullptr);
    giveBack();
    for (size_t i = 0; i < kSignals.size(); ++i) ::sigaction(kSignals[i], &g_reactions[i], nullptr);
}

char CKeyboard::wait(int milliseconds) {
    const int key = waitForKey(milliseconds);
    return key > 0 && key < 128 ? static_cast<char>(key) : '\0';
}

int CKeyboard::waitForKey(int milliseconds) {
    take(); // again after the program was suspended or came to the foreground
    const char first = readByte(milliseconds);
    if (first != kEscape) return static_cast<unsigned char>(first);
    // Parameters, then a letter; the rest of a sequence that is not known must not count as keys.
    std::string sequence;
    do {
        const char next = readByte(kSequenceMilliseconds);
        if (next == 0) return sequence.empty() ? kEscape : 0;
        sequence += next;
    } while (sequence.size() < kLongestSequence &&
             (sequence.size() < 2 || std::strchr("0123456789;", sequence.back()) != nullptr));
    for (const auto& known : kSequences)
        if (sequence == known.sequence) return known.key;
    return 0;
}

char CKeyboard::readByte(int milliseconds) {
    pollfd input{STDIN_FILENO, POLLIN, 0};
    if (::poll(&input, g_isTaken ? 1 : 0, milliseconds) <= 0) return 0;
    char key = 0;
    if ((input.revents & POLLIN) != 0 && ::read(STDIN_FILENO, &key, 1) == 1) return key;
    ::poll(nullptr, 0, milliseconds); // poll() returns at once for a terminal that is gone
    return 0;
}

} // namespace host

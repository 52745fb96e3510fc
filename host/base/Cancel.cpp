#include "base/Cancel.h"

#include <atomic>
#include <csignal>
#include <initializer_list>

namespace host {

namespace {

volatile std::sig_atomic_t g_cancelled = 0;
std::atomic<void (*)()> g_react{nullptr};

} // namespace

void watchForCancel() {
    struct sigaction action = {};
    action.sa_handler = [](int) {
        g_cancelled = 1;
        if (void (*react)() = g_react) react();
    };
    action.sa_flags = static_cast<int>(SA_RESETHAND);
    sigemptyset(&action.sa_mask);
    for (int signal : {SIGINT, SIGTERM, SIGHUP}) {
        struct sigaction old = {};
        sigaction(signal, nullptr, &old);
        if (old.sa_handler != SIG_IGN) sigaction(signal, &action, nullptr); // still ignored under nohup
    }
    // The failed write is reported where it happens, and temporary files are removed.
    for (int ignored : {SIGPIPE, SIGXFSZ}) std::signal(ignored, SIG_IGN);
}

bool isCancelled() {
    return g_cancelled != 0;
}

void onCancel(void (*react)()) {
    g_react = react;
}

} // namespace host

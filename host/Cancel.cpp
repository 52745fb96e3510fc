#include "Cancel.h"

#include <csignal>
#include <initializer_list>

namespace host {

namespace {

volatile std::sig_atomic_t g_cancelled = 0;

} // namespace

void watchForCancel() {
    struct sigaction action = {};
    action.sa_handler = [](int) { g_cancelled = 1; };
    action.sa_flags = static_cast<int>(SA_RESETHAND);
    sigemptyset(&action.sa_mask);
    for (int signal : {SIGINT, SIGTERM}) sigaction(signal, &action, nullptr);
}

bool isCancelled() {
    return g_cancelled != 0;
}

} // namespace host

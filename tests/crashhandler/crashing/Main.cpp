// Crashes in the way given by the first argument; the second is the folder for report and dump.
#include <tonewright/tonewright.h>

#include "peru/threads/IThreadManager.h"

#include <atomic>
#include <csetjmp>
#include <csignal>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <dlfcn.h>
#include <exception>
#include <stdexcept>
#include <string>
#include <thread>
#include <unistd.h>
#include <vector>

namespace {

volatile uintptr_t g_address = 16; // not mapped, and opaque to the compiler

void crash() {
    volatile char text[] = "on the crashing stack";
    *reinterpret_cast<volatile int*>(g_address) = text[0];
}

int recurse(int depth) {
    volatile char frame[4096];
    frame[0] = static_cast<char>(depth);
    return depth < 0 ? 0 : recurse(depth + 1) + frame[0];
}

std::atomic<int> g_progress{0};
sigjmp_buf g_start;

void overflow(peru::IBase*, void*) {
    recurse(1);
}

// Crashes in many threads at the same moment.
void crashTogether() {
    std::atomic<int> waiting{8};
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i)
        threads.emplace_back([&] {
            --waiting;
            while (waiting > 0) {
            }
            crash();
        });
    for (std::thread& thread : threads) thread.join();
}

// The host survives its own crash if the other threads go on.
[[noreturn]] void recover() {
    if (sigsetjmp(g_start, 1) == 0) crash();
    for (const int before = g_progress; g_progress == before;) ::usleep(1000);
    ::_exit(77);
}

} // namespace

int main(int argc, char** argv) {
    if (argc != 3) return 2;
    const std::string kind = argv[1], folder = argv[2];
    const std::string report = folder + "/report.txt", dump = folder + "/dump";
    const auto wide = [](const std::string& text) { return std::u16string(text.begin(), text.end()); };
    if (kind == "recover") std::signal(SIGSEGV, [](int) { siglongjmp(g_start, 1); });
    std::set_terminate([] {
        std::fputs("terminated", stderr);
        std::abort();
    });
    void* library = ::dlopen(LIBRARY, RTLD_NOW | RTLD_LOCAL);
    if (!library) return 3;
    const auto install = reinterpret_cast<decltype(&TONEWRIGHT_Init_Crashhandler)>(
        ::dlsym(library, "TONEWRIGHT_Init_Crashhandler"));
    install(u"Crashing 1.0", wide(report).c_str(), wide(dump).c_str());
    if (kind == "unloaded") ::dlclose(library);
    std::thread([] {
        for (;; ::usleep(1000)) ++g_progress;
    }).detach();
    if (kind == "loading") {
        std::thread([] { ::dlopen(ENDLESS, RTLD_NOW); }).detach();
        while (!std::getenv("ENDLESS_LOADING")) ::usleep(1000);
    }

    if (kind == "segv" || kind == "unloaded" || kind == "loading") crash();
    if (kind == "recover") recover();
    if (kind == "together") crashTogether();
    if (kind == "thread overflow") {
        peru::SThreadBody body;
        body.function = overflow;
        peru::getThreadManager()->createThread(body)->wait();
    }
    if (kind == "throw") throw std::runtime_error("nobody catches this");
    if (kind == "overflow") return recurse(1);
    if (kind == "abort") std::abort();
    if (kind.starts_with("kill")) {
        ::kill(::getpid(), std::stoi(kind.substr(4)));
        for (;;) ::pause(); // another thread may have got the signal
    }
    return 0;
}

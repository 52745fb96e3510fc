// Crashes in the way given by the first argument; the second is the folder for report and dump.
#include <tonewright/tonewright.h>

#include <csignal>
#include <cstdint>
#include <cstdlib>
#include <dlfcn.h>
#include <stdexcept>
#include <string>
#include <thread>
#include <unistd.h>

namespace {

int recurse(int depth) {
    volatile char frame[4096];
    frame[0] = static_cast<char>(depth);
    return depth < 0 ? 0 : recurse(depth + 1) + frame[0];
}

} // namespace

int main(int argc, char** argv) {
    if (argc != 3) return 2;
    volatile uintptr_t address = 16; // not mapped, and opaque to the compiler
    const std::string kind = argv[1], folder = argv[2];
    const std::string report = folder + "/report.txt", dump = folder + "/dump";
    const auto wide = [](const std::string& text) { return std::u16string(text.begin(), text.end()); };
    if (kind == "chain") std::signal(SIGSEGV, [](int) { ::_exit(77); });
    void* library = ::dlopen(LIBRARY, RTLD_NOW | RTLD_LOCAL);
    if (!library) return 3;
    const auto install = reinterpret_cast<decltype(&TONEWRIGHT_Init_Crashhandler)>(
        ::dlsym(library, "TONEWRIGHT_Init_Crashhandler"));
    install(u"Crashing 1.0", wide(report).c_str(), wide(dump).c_str());
    if (kind == "unloaded") ::dlclose(library);
    std::thread([] { ::pause(); }).detach();

    if (kind == "segv" || kind == "chain" || kind == "unloaded")
        *reinterpret_cast<volatile int*>(address) = 1;
    if (kind == "throw") throw std::runtime_error("nobody catches this");
    if (kind == "overflow") return recurse(1);
    if (kind == "abort") std::abort();
    return 0;
}

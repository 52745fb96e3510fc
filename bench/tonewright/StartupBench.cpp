// Where the time goes from the start of a process to the end of TONEWRIGHT_InitStartup.
//
// Each run starts two new processes. The first is timed as a whole; the second performs the same steps one by
// one and marks the end of each. Both send their marks through a pipe, on the starting process's clock.
#include "peru/log/ILog.h"
#include "peru/system/IDynamicLibrary.h"
#include "peru/system/ISystem.h"
#include "sonora2/context/SonoraContextAudio.h"
#include "sonora2/plugins/PluginHandler.h"
#include "tonewright/tonewright.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <initializer_list>
#include <spawn.h>
#include <string>
#include <sys/wait.h>
#include <unistd.h>
#include <vector>

extern char** environ;

namespace {

using peru::CString;
using peru::make;
using peru::P;
using sonora2::common::CPluginHandler;
using sonora2::common::ISonoraContext;

constexpr int kRuns = 41;
constexpr double kTarget = 30.0; // milliseconds

int64_t now() {
    timespec time;
    clock_gettime(CLOCK_MONOTONIC, &time);
    return int64_t{time.tv_sec} * 1'000'000'000 + time.tv_nsec;
}

// --- The measured processes

std::vector<std::pair<std::string, int64_t>> g_marks; // what has just ended, and when

void mark(const std::string& step) {
    g_marks.emplace_back(step, now());
}

void tellMarks() {
    for (const auto& [step, time] : g_marks)
        std::printf("%s\t%lld\n", step.c_str(), static_cast<long long>(time));
    std::fflush(stdout);
}

int runWhole() {
    if (TONEWRIGHT_InitStartup() != TONEWRIGHT_OK) return 1;
    mark("whole");
    tellMarks();
    TONEWRIGHT_DeInitAll();
    return 0;
}

// The first name creates the handler, which then loads the others.
P<CPluginHandler> loadPlugins(const P<ISonoraContext>& context, const std::string& direction,
                              std::initializer_list<const char*> names) {
    P<CPluginHandler> handler;
    for (const char* name : names) {
        const int before = handler ? handler->getPluginCount() : 0;
        if (handler) {
            handler->loadPlugin(name);
        } else {
            context->addPluginName(name);
            handler = make<CPluginHandler>(context);
        }
        const char* remark = handler->getPluginCount() > before ? "" : " (absent)";
        mark(direction + " handler: " + name + remark);
    }
    return handler;
}

// The plug-ins are those named by the application.
int runParts() {
    peru::getLogManager()->info(CString::fromUTF8("tonewright_bench"), "started");
    peru::getSystem()->getMainExecutableFile()->getParent();
    const P<ISonoraContext> readContext = make<sonora2::audio::CSonoraContextAudio>();
    const P<ISonoraContext> writeContext = make<sonora2::audio::CSonoraContextAudio>();
    mark("application object, log, contexts");
    const P<CPluginHandler> reader =
        loadPlugins(readContext, "read",
                    {"sonora2_flac", "sonora2_decmpa", "sonora2_vorbis", "sonora2_wav", "sonora2_wmf",
                     "sonora2_dsgraph", "sonora2_discio"});
    const P<CPluginHandler> writer =
        loadPlugins(writeContext, "write",
                    {"sonora2_flac", "sonora2_l3codec", "sonora2_vorbis", "sonora2_wav", "sonora2_wmf"});
    const P<peru::IProcessManager> processes = peru::getProcessManager();
    const std::vector<P<peru::IURI>> folders =
        peru::getSystem()->getSearchFolders("TONEWRIGHT_COMPANION_PATH", "libexec/tonewright");
    if (folders.empty()) return 1;
    const P<peru::IURI> companion = folders.front()->appendPath("CancelAutoplay2");
    const P<peru::IProcess> process =
        processes->start(companion, {CString::fromUTF8(std::to_string(processes->getCurrentProcessId())),
                                     CString::fromUTF8("dummy")});
    mark("companion");
    tellMarks();
    process->terminate();
    return 0;
}

// --- The measuring process

// One step's durations in milliseconds.
struct SStep {
    std::string name;
    std::vector<double> times;
};

void enter(std::vector<SStep>& steps, const std::string& name, double time) {
    auto found = std::find_if(steps.begin(), steps.end(), [&](const SStep& s) { return s.name == name; });
    if (found == steps.end()) found = steps.insert(steps.end(), {name, {}});
    found->times.push_back(time);
}

double median(std::vector<double> times) {
    std::sort(times.begin(), times.end());
    return times[times.size() / 2];
}

// Starts this program in the given role and records the duration of each of its steps.
bool measure(const char* role, std::vector<SStep>& steps) {
    int ends[2];
    if (pipe(ends) != 0) return false;
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, ends[1], STDOUT_FILENO);
    posix_spawn_file_actions_addclose(&actions, ends[0]);
    posix_spawn_file_actions_addclose(&actions, ends[1]);
    std::string program = "/proc/self/exe", argument = role;
    char* arguments[] = {program.data(), argument.data(), nullptr};
    pid_t child = 0;
    int64_t last = now();
    const int error = posix_spawn(&child, program.c_str(), &actions, nullptr, arguments, environ);
    posix_spawn_file_actions_destroy(&actions);
    close(ends[1]);
    if (error != 0) {
        close(ends[0]);
        return false;
    }
    FILE* output = fdopen(ends[0], "r");
    char line[512];
    while (output && std::fgets(line, sizeof line, output)) {
        char* tab = std::strchr(line, '\t');
        if (!tab) continue;
        const int64_t time = std::strtoll(tab + 1, nullptr, 10);
        enter(steps, std::string(line, tab), static_cast<double>(time - last) / 1e6);
        last = time;
    }
    if (output) std::fclose(output);
    int status = 0;
    waitpid(child, &status, 0);
    return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

void print(const char* name, const std::vector<double>& times) {
    std::printf("| %-40s | %6.2f | %6.2f | %6.2f |\n", name, median(times),
                *std::min_element(times.begin(), times.end()), *std::max_element(times.begin(), times.end()));
}

int runAll() {
    setenv("TONEWRIGHT_DEBUG_OUTPUT", "0", 1);
    std::vector<SStep> whole, parts;
    // The first run brings the files into memory and is not counted.
    for (int run = 0; run <= kRuns; ++run) {
        if (!measure("whole", whole) || !measure("parts", parts)) {
            std::fprintf(stderr, "a measured process failed\n");
            return 1;
        }
        if (run == 0) whole.clear(), parts.clear();
    }
    std::vector<double> totals(kRuns, 0.0);
    for (const SStep& step : whole)
        for (size_t i = 0; i < step.times.size(); ++i) totals[i] += step.times[i];

    std::printf("| Milliseconds, %d runs                     | median |    min |    max |\n", kRuns);
    std::printf("|------------------------------------------|-------:|-------:|-------:|\n");
    for (const SStep& step : parts) print(step.name.c_str(), step.times);
    print("whole, to InitStartup returned", totals);
    const double time = median(totals);
    std::printf("\n%.2f ms of %.0f ms\n", time, kTarget);
    return time < kTarget ? 0 : 1;
}

} // namespace

// Other arguments belong to the neighbouring benchmarks and are ignored.
int main(int argc, char** argv) {
    mark("process and loader, until main");
    const std::string role = argc > 1 ? argv[1] : "";
    if (role == "whole") return runWhole();
    if (role == "parts") return runParts();
    return runAll();
}

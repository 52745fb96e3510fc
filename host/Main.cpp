// tonewright: converts, plays, mixes and records sound files, shows their properties, draws their waveforms
// and changes their tags.
#include "arguments/Arguments.h"
#include "arguments/Shared.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "library/HostLog.h"
#include "media/Devices.h"
#include "media/FormatOptions.h"
#include "parser/Parser.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <iterator>
#include <limits>
#include <map>
#include <string_view>
#include <tonewright/host.h>

namespace {

using namespace host;

const std::map<std::string, int32_t> kLogLevels{
    {"trace", TONEWRIGHT_LOG_TRACE},     {"debug", TONEWRIGHT_LOG_DEBUG},
    {"info", TONEWRIGHT_LOG_INFO},       {"warning", TONEWRIGHT_LOG_WARNING},
    {"error", TONEWRIGHT_LOG_EXCEPTION}, {"off", std::numeric_limits<int32_t>::max()}};

// Adds the named command alone, since describing the options of all takes as long as a short job. Without a
// command of that name, adds all.
void addCommands(CLI::App& app, Run& run, std::string_view name) {
    struct SCommand {
        const char* name;
        void (*add)(CLI::App&, Run&);
    };
    constexpr SCommand kCommands[] = {{"convert", addConvert},   {"info", addInfo},
                                      {"formats", addFormats},   {"waveform", addWaveform},
                                      {"loudness", addLoudness}, {"devices", addDevices},
                                      {"play", addPlay},         {"mix", addMix},
                                      {"record", addRecord},     {"tag", addTag},
                                      {"drives", addDrives},     {"disc", addDisc},
                                      {"rip", addRip},           {"burn", addBurn},
                                      {"cddb", addCddb},         {"get", addGet}};
    const bool isKnown = std::any_of(std::begin(kCommands), std::end(kCommands),
                                     [&](const SCommand& each) { return name == each.name; });
    for (const SCommand& each : kCommands)
        if (!isKnown || name == each.name) each.add(app, run);
}

// Exceptions that the commands do not catch are failures of the job, not of loading the library.
int runCommand(const Run& run, CLibrary& library) {
    try {
        const int code = run(library);
        requireOutput();
        return code;
    } catch (const CUsageError& failure) {
        std::fprintf(stderr, "tonewright: %s\n", toPrintable(failure.what()).c_str());
        return kExitUsage;
    } catch (const CNoDevice& failure) {
        std::fprintf(stderr, "tonewright: %s\n", failure.what());
        return kExitNoDevice;
    } catch (const std::exception& failure) {
        std::error_code error;
        const bool isGone = std::filesystem::current_path(error).empty();
        std::fprintf(stderr, "tonewright: %s\n",
                     isGone ? tr("host.noCurrentFolder", "The current folder does not exist").c_str()
                            : failure.what());
        return kExitFailure;
    }
}

} // namespace

int main(int argc, char** argv) {
    if (!chooseLanguage("tonewright", argc, argv)) return kExitUsage;
    CLI::App app(
        tr("host.help",
           "Converts, plays, mixes and records sound files, shows their properties, draws their waveforms "
           "and changes their tags."),
        "tonewright");
    addCommonOptions(app, "tonewright " TONEWRIGHT_VERSION);
    int32_t printLevel = std::numeric_limits<int32_t>::max();
    app.add_option(
           "--log-level", printLevel,
           tr("host.help.logLevel",
              "Print the library's log from this level on: trace, debug, info, warning, error or off"))
        ->option_text("LEVEL")
        ->transform(CLI::CheckedTransformer(kLogLevels, CLI::ignore_case).description(""));
    std::string boxed;
    addBoxed(app, boxed);
    addLanguage(app);
    app.footer(
        tr("host.help.exitCodes",
           "Exit codes: 0 success, 1 a file failed, 2 invalid arguments, 3 no sound device, 4 the library "
           "cannot be loaded or started, 130 stopped by Ctrl-C."));

    Run run;
    addCommands(app, run, argc > 1 ? argv[1] : "");
    if (const std::optional<int> code = parseArguments(app, argc, argv)) return *code;

    // Other programs stop reading the fields of a WAV file at one of odd length without padding.
    ::setenv("TONEWRIGHT_PAD_INFO", "1", 0);
    if (!boxed.empty()) ::setenv("TONEWRIGHT_BOXED", boxed.c_str(), 1);
    try {
        watchForCancel();
        CLibrary library;
        CHostLog log(library, printLevel);
        library.start();
        return runCommand(run, library);
    } catch (const std::exception& error) {
        std::fprintf(stderr, "tonewright: %s\n", error.what());
        return kExitNoLibrary;
    }
}

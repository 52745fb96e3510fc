// tonewright: converts, plays, mixes and records sound files, shows their properties, draws their waveforms
// and changes their tags.
#include "arguments/Arguments.h"
#include "arguments/Shared.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "library/HostLog.h"
#include "media/Devices.h"
#include "media/FormatOptions.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <limits>
#include <map>
#include <tonewright/host.h>

namespace {

using namespace host;

const std::map<std::string, int32_t> kLogLevels{
    {"trace", TONEWRIGHT_LOG_TRACE},     {"debug", TONEWRIGHT_LOG_DEBUG},
    {"info", TONEWRIGHT_LOG_INFO},       {"warning", TONEWRIGHT_LOG_WARNING},
    {"error", TONEWRIGHT_LOG_EXCEPTION}, {"off", std::numeric_limits<int32_t>::max()}};

// In the parser's order, last argument first. "--title=" is split into the option and an empty value, since
// the parser would otherwise take the next argument as the value.
std::vector<std::string> splitArguments(int argc, char** argv) {
    std::vector<std::string> arguments;
    bool hasOptions = true;
    for (const std::string& argument : std::vector<std::string>(argv + 1, argv + argc)) {
        hasOptions = hasOptions && argument != "--";
        if (hasOptions && argument.starts_with("--") && argument.find('=') == argument.size() - 1)
            arguments.insert(arguments.end(), {argument.substr(0, argument.size() - 1), ""});
        else
            arguments.push_back(argument);
    }
    std::reverse(arguments.begin(), arguments.end());
    return arguments;
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
                     isGone ? "The current folder does not exist" : failure.what());
        return kExitFailure;
    }
}

} // namespace

int main(int argc, char** argv) {
    CLI::App app(
        "Converts, plays, mixes and records sound files, shows their properties, draws their waveforms "
        "and changes their tags.",
        "tonewright");
    app.set_version_flag("--version", "tonewright " TONEWRIGHT_VERSION);
    app.require_subcommand(1);
    app.fallthrough(); // the options below may also follow the command
    app.get_formatter()->column_width(28);
    int32_t printLevel = std::numeric_limits<int32_t>::max();
    app.add_option("--log-level", printLevel,
                   "Print the library's log from this level on: trace, debug, info, warning, error or off")
        ->option_text("LEVEL")
        ->transform(CLI::CheckedTransformer(kLogLevels, CLI::ignore_case).description(""));
    std::string boxed;
    addBoxed(app, boxed);
    app.footer(
        "Exit codes: 0 success, 1 a file failed, 2 invalid arguments, 3 no sound device, 4 the library "
        "cannot be loaded or started, 130 stopped by Ctrl-C.");

    Run run;
    for (const auto add : {addConvert, addInfo, addFormats, addWaveform, addDevices, addPlay, addMix,
                           addRecord, addTag, addCddb, addGet})
        add(app, run);
    // The parser's own message would not name the unknown command.
    const auto isMeant = [&](const CLI::App* command) { return command->check_name(argv[1]); };
    if (argc > 1 && argv[1][0] != '-' && app.get_subcommands(isMeant).empty()) {
        std::fprintf(stderr, "Unknown command: %s\nRun with --help for more information.\n",
                     toPrintable(argv[1]).c_str());
        return kExitUsage;
    }
    try {
        app.parse(splitArguments(argc, argv));
    } catch (const CLI::ParseError& error) {
        return app.exit(error) == 0 ? kExitSuccess : kExitUsage;
    }

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

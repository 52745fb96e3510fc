// tonewright: converts, plays, mixes and records sound files, shows their properties, draws their waveforms
// and changes their tags.
#include "arguments/Arguments.h"
#include "arguments/ParserErrors.h"
#include "arguments/Shared.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
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

// The value of --lang, or null.
const char* findLanguage(int argc, char** argv) {
    for (int i = 1; i < argc && std::string_view(argv[i]) != "--"; ++i) {
        const std::string_view argument = argv[i];
        if (argument.starts_with("--lang=")) return argv[i] + std::string_view("--lang=").size();
        if (argument == "--lang" && i + 1 < argc) return argv[i + 1];
    }
    return nullptr;
}

// The words of the parser's own. Commands inherit them if they are added afterwards.
void translateHelp(CLI::App& app) {
    app.option_defaults()->group(tr("host.help.Options", "Options"));
    app.group(tr("host.help.Subcommands", "Subcommands"));
    app.set_help_flag("-h,--help", tr("host.help.help", "Print this help message and exit"));
    app.failure_message([](const CLI::App*, const CLI::Error& error) {
        return translateParserMessage(error.what()) + "\n" +
               tr("host.moreHelp", "Run with --help for more information.") + "\n";
    });
    const auto formatter = app.get_formatter();
    formatter->label("Usage", tr("host.help.Usage", "Usage"));
    formatter->label("Positionals", tr("host.help.Positionals", "Positionals"));
    formatter->label("OPTIONS", tr("host.help.OPTIONS", "OPTIONS"));
    formatter->label("SUBCOMMAND", tr("host.help.SUBCOMMAND", "SUBCOMMAND"));
    formatter->label("REQUIRED", tr("host.help.REQUIRED", "REQUIRED"));
    formatter->label("Needs", tr("host.help.Needs", "Needs"));
    formatter->label("Excludes", tr("host.help.Excludes", "Excludes"));
}

// Commands get "--help" before the defaults of options.
void groupHelp(CLI::App& app) {
    for (CLI::App* const command : app.get_subcommands({})) {
        command->get_help_ptr()->group(tr("host.help.Options", "Options"));
        groupHelp(*command);
    }
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
    // Before the options are described.
    const char* const language = findLanguage(argc, argv);
    if (!setLanguage(language)) {
        std::fprintf(stderr, "tonewright: There is no translation for the language %s\n",
                     toPrintable(language).c_str());
        return kExitUsage;
    }
    CLI::App app(
        tr("host.help",
           "Converts, plays, mixes and records sound files, shows their properties, draws their waveforms "
           "and changes their tags."),
        "tonewright");
    translateHelp(app);
    app.set_version_flag("--version", "tonewright " TONEWRIGHT_VERSION,
                         tr("host.help.version", "Display program version information and exit"));
    app.require_subcommand(1);
    app.fallthrough(); // the options below may also follow the command
    app.get_formatter()->column_width(28);
    int32_t printLevel = std::numeric_limits<int32_t>::max();
    app.add_option(
           "--log-level", printLevel,
           tr("host.help.logLevel",
              "Print the library's log from this level on: trace, debug, info, warning, error or off"))
        ->option_text("LEVEL")
        ->transform(CLI::CheckedTransformer(kLogLevels, CLI::ignore_case).description(""));
    std::string boxed;
    addBoxed(app, boxed);
    app.add_option("--lang")
        ->description(tr("host.help.lang",
                         "Language of the texts, such as de or de_AT (default: that of the environment)"))
        ->option_text("LANGUAGE");
    app.footer(
        tr("host.help.exitCodes",
           "Exit codes: 0 success, 1 a file failed, 2 invalid arguments, 3 no sound device, 4 the library "
           "cannot be loaded or started, 130 stopped by Ctrl-C."));

    Run run;
    for (const auto add : {addConvert, addInfo, addFormats, addWaveform, addLoudness, addDevices, addPlay,
                           addMix, addRecord, addTag, addDrives, addDisc, addRip, addBurn, addCddb, addGet})
        add(app, run);
    groupHelp(app);
    // The parser's own message would not name the unknown command.
    const auto isMeant = [&](const CLI::App* command) { return command->check_name(argv[1]); };
    if (argc > 1 && argv[1][0] != '-' && app.get_subcommands(isMeant).empty()) {
        std::fprintf(stderr, "%s\n",
                     tr("host.unknownCommand",
                        "Unknown command: %NAME%\nRun with --help for more information.",
                        {{"%NAME%", toPrintable(argv[1])}})
                         .c_str());
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

#include "parser/Parser.h"

#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "parser/ParserErrors.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>

namespace host {

namespace {

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

// Commands get "--help" before the defaults of options.
void groupHelp(CLI::App& app) {
    for (CLI::App* const command : app.get_subcommands({})) {
        command->get_help_ptr()->group(tr("host.help.Options", "Options"));
        groupHelp(*command);
    }
}

} // namespace

bool chooseLanguage(const char* program, int argc, char** argv) {
    const char* const language = findLanguage(argc, argv);
    if (setLanguage(language)) return true;
    std::fprintf(stderr, "%s: There is no translation for the language %s\n", program,
                 toPrintable(language).c_str());
    return false;
}

void addCommonOptions(CLI::App& app, const std::string& versionText) {
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
    formatter->column_width(28);
    app.set_version_flag("--version", versionText,
                         tr("host.help.version", "Display program version information and exit"));
    app.require_subcommand(1);
    app.fallthrough(); // the program's own options may also follow the command
}

void addLanguage(CLI::App& app) {
    app.add_option("--lang")
        ->description(tr("host.help.lang",
                         "Language of the texts, such as de or de_AT (default: that of the environment)"))
        ->option_text("LANGUAGE");
}

std::optional<int> parseArguments(CLI::App& app, int argc, char** argv) {
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
    return std::nullopt;
}

std::string isNumber(const std::string& text) {
    return std::isnan(std::strtod(text.c_str(), nullptr))
               ? tr("host.arguments.isNotANumber", "is not a number")
               : "";
}

} // namespace host

// What the command lines of the programs have in common.
#pragma once

#include <CLI/CLI.hpp>
#include <optional>
#include <string>

namespace host {

// Sets the language that the option --lang or the environment names. Call it before options are described.
// Without a translation for the option, it prints why and returns false.
bool chooseLanguage(const char* program, int argc, char** argv);

// Adds --help, --version and --lang and translates the parser's own words. Commands inherit the texts if they
// are added afterwards.
void addCommonOptions(CLI::App& app, const std::string& versionText);
// Only describes the option, which chooseLanguage() has read already.
void addLanguage(CLI::App& app);

// Reads the arguments. Returns an exit code if the program is to end: after a help text, or after an error
// that was printed. The call runs the callbacks of options and commands.
std::optional<int> parseArguments(CLI::App& app, int argc, char** argv);

// A check for numbers, since CLI::Range accepts NaN.
std::string isNumber(const std::string& text);

} // namespace host

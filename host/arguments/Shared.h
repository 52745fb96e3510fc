// What the arguments of several commands have in common.
#pragma once

#include "library/Library.h"
#include "media/FormatOptions.h"
#include "parser/Parser.h"
#include "terminal/Progress.h"

#include <CLI/CLI.hpp>
#include <functional>
#include <set>
#include <string>

namespace host {

// The command that the user chose; set by the parser. Returns an exit code.
using Run = std::function<int(CLibrary&)>;

// The options of the output format. `widths` are the bits per sample to choose from.
void addFormat(CLI::App& command, SFormatOptions& options, const std::set<int>& widths);
// "44100", "44.1k" or "44.1 kHz" as a whole number. Transforms the text, or returns why it is none.
std::string toWholeNumber(std::string& text, const std::string& unit);

// Throws CLI::ValidationError if the bit rates contradict each other.
void checkBitRates(const SFormatOptions& options);

// A check for a loudness in LUFS.
std::string isLoudness(const std::string& text);

// "-j", with the number of processor cores as the default.
void addJobs(CLI::App& command, int& jobs, const std::string& help);

// "--boxed" with or without a list of plug-ins, which is left empty without the option.
void addBoxed(CLI::App& app, std::string& plugins);

// "--json" and "--quiet".
void addOutput(CLI::App& command, EOutput& show);

} // namespace host

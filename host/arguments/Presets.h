// Named sets of options.
#pragma once

#include <CLI/CLI.hpp>

namespace host {

// Adds "--preset" and "--list-presets". The command has the options of addFormat(), "--to" and "--resampler".
void addPresets(CLI::App& command);

// Sets the options of the chosen preset that are not set on the command line. "--to" gives way to "--output
// FILE", and the preset's quality and bit rates together give way to any of these. The user's own presets are
// files in the folder "tonewright/presets" of the configuration; they hide built-in ones of the same name.
// Throws CLI::ValidationError, which names the file and the key.
void applyPreset(CLI::App& command);

} // namespace host

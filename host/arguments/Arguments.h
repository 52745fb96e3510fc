// The commands' arguments: each function adds one command to the parser, which sets `run` when the user chose
// it.
#pragma once

#include "arguments/Shared.h"

namespace host {

void addConvert(CLI::App& app, Run& run);
void addInfo(CLI::App& app, Run& run);
void addFormats(CLI::App& app, Run& run);
void addWaveform(CLI::App& app, Run& run);
void addDevices(CLI::App& app, Run& run);
void addPlay(CLI::App& app, Run& run);
void addLoudness(CLI::App& app, Run& run);
void addMix(CLI::App& app, Run& run);
void addRecord(CLI::App& app, Run& run);
void addTag(CLI::App& app, Run& run);
void addDrives(CLI::App& app, Run& run);
void addDisc(CLI::App& app, Run& run);
void addRip(CLI::App& app, Run& run);
void addBurn(CLI::App& app, Run& run);
void addCddb(CLI::App& app, Run& run);
void addGet(CLI::App& app, Run& run);

} // namespace host

// The options of commands that look discs up.
#pragma once

#include "media/CddbLookup.h"

#include <CLI/CLI.hpp>

namespace host {

// "--server" and what else concerns the requests.
void addCddbAccess(CLI::App& command, SCddbAccess& access);
// "--pick".
void addCddbPick(CLI::App& command, int& pick);
// To be called once the arguments are known: takes the server from the environment if none was given. Throws
// CLI::RequiredError if there is none.
void requireCddbServer(SCddbAccess& access);

} // namespace host

#include "media/Devices.h"
#include "arguments/Arguments.h"
#include "commands/ListDevices.h"

#include <memory>

namespace host {

void addDevices(CLI::App& app, Run& run) {
    const auto json = std::make_shared<bool>(false);
    CLI::App* command = app.add_subcommand("devices", "List the sound devices that play and record.");
    command->add_flag("--json", *json, "Print one JSON object per line");
    command->callback([json, &run] {
        run = [json](CLibrary&) { return needingDevice(*json, [&] { return listDevices(*json); }); };
    });
}

} // namespace host

#include "media/Devices.h"
#include "arguments/Arguments.h"
#include "base/Translation.h"
#include "commands/ListDevices.h"

#include <memory>

namespace host {

void addDevices(CLI::App& app, Run& run) {
    struct SOptions {
        bool json = false;
        bool watches = false;
    };
    const auto options = std::make_shared<SOptions>();
    CLI::App* command = app.add_subcommand(
        "devices", tr("host.help.devices", "List the sound devices that play and record."));
    command->add_flag("--json", options->json, tr("host.help.jsonLines", "Print one JSON object per line"));
    command->add_flag(
        "-w,--watch", options->watches,
        tr("host.help.devices.watch", "Also print devices that are added or removed later, until Ctrl-C"));
    command->callback([options, &run] {
        run = [options](CLibrary&) {
            if (options->watches) return watchDevices(options->json);
            return needingDevice(options->json, [&] { return listDevices(options->json); });
        };
    });
}

} // namespace host

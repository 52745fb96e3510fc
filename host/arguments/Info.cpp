#include "commands/Info.h"
#include "arguments/Arguments.h"
#include "base/Translation.h"

#include <memory>

namespace host {

void addInfo(CLI::App& app, Run& run) {
    const auto files = std::make_shared<std::vector<std::filesystem::path>>();
    const auto json = std::make_shared<bool>(false);
    CLI::App* command = app.add_subcommand(
        "info",
        tr("host.help.info", "Show duration, sample rate, channels and bits per sample of sound files."));
    command->add_option("FILE", *files, tr("host.help.info.FILE", "Files or http addresses to examine"))
        ->required()
        ->option_text("...");
    command->add_flag("--json", *json, tr("host.help.jsonLines", "Print one JSON object per line"));
    command->callback([files, json, &run] {
        run = [files, json](CLibrary& library) { return showInfo(library, *files, *json); };
    });
}

} // namespace host

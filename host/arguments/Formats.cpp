#include "commands/Formats.h"
#include "arguments/Arguments.h"

#include <memory>

namespace host {

void addFormats(CLI::App& app, Run& run) {
    const auto json = std::make_shared<bool>(false);
    CLI::App* command = app.add_subcommand("formats", "List the file extensions that can be read.");
    command->add_flag("--json", *json, "Print one JSON object");
    command->callback(
        [json, &run] { run = [json](CLibrary& library) { return listFormats(library, *json); }; });
}

} // namespace host

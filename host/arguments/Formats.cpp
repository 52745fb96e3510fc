#include "commands/Formats.h"
#include "arguments/Arguments.h"
#include "base/Translation.h"

#include <memory>

namespace host {

void addFormats(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SFormatsOptions>();
    CLI::App* command =
        app.add_subcommand("formats", tr("host.help.formats", "List the file extensions that can be read."));
    command->add_flag("-l,--long", options->table,
                      tr("host.help.formats.long",
                         "Print a table that also shows what can be written, which files can have a tag, the "
                         "plug-ins\nthat read "
                         "and write them, and whether these run boxed: in a process of their own"));
    command->add_flag("--json", options->json,
                      tr("host.help.formats.json", "Print one JSON object with all of this"));
    command->callback(
        [options, &run] { run = [options](CLibrary& library) { return listFormats(library, *options); }; });
}

} // namespace host

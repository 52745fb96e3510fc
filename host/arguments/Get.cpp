#include "commands/Get.h"
#include "arguments/Arguments.h"
#include "base/Translation.h"

#include <memory>

namespace host {

void addGet(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SGetOptions>();
    CLI::App* command = app.add_subcommand(
        "get", tr("host.help.get",
                  "Copy a file from a web server. The copy appears once it is complete, or not at all."));
    command
        ->add_option("ADDRESS", options->address,
                     tr("host.help.get.ADDRESS", "Such as http://host/folder/song.flac"))
        ->required()
        ->option_text(" ");
    command
        ->add_option("-o,--output", options->output,
                     tr("host.help.get.output",
                        "File to write (default: the name in the address, in the current folder)"))
        ->option_text("FILE");
    command->add_flag("-f,--force", options->force, tr("host.help.forceOne", "Replace an existing file"));
    addOutput(*command, options->show);
    command->callback([options, &run] { run = [options](CLibrary&) { return getFile(*options); }; });
}

} // namespace host

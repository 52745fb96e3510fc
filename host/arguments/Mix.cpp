#include "commands/Mix.h"
#include "arguments/Arguments.h"
#include "base/Translation.h"

#include <memory>

namespace host {

void addMix(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SMixOptions>();
    CLI::App* command = app.add_subcommand(
        "mix", tr("host.help.mix", "Mix an editor's arrangement into one sound file (default: 44100 Hz, 2 "
                                   "channels). Relative URIs\nin it are resolved against its folder."));
    command
        ->add_option("ARRANGEMENT", options->input,
                     tr("host.help.mix.ARRANGEMENT", "XML file that describes the tracks"))
        ->required()
        ->option_text(" ");
    command
        ->add_option("-o,--output", options->output,
                     tr("host.help.output", "File to write; its extension selects the format"))
        ->required()
        ->option_text("FILE");
    addFormat(*command, *options, {16});
    command->add_flag("-f,--force", options->force, tr("host.help.force", "Replace existing files"));
    addOutput(*command, options->show);
    command->callback([options, &run] {
        checkBitRates(*options);
        run = [options](CLibrary& library) { return mix(library, *options); };
    });
}

} // namespace host

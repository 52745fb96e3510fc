#include "commands/Play.h"
#include "arguments/Arguments.h"
#include "media/Devices.h"

#include <memory>

namespace host {

void addPlay(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SPlayOptions>();
    CLI::App* command = app.add_subcommand(
        "play",
        "Play sound files and arrangements (.xml) on the default device. Space pauses and resumes, q or\n"
        "Ctrl-C stops. A file that fails is reported and the next one is played.");
    command->add_option("FILE", options->files, "Files to play")->required()->option_text("...");
    addOutput(*command, options->show);
    command->callback([options, &run] {
        run = [options](CLibrary& library) {
            return needingDevice(options->show == EOutput::json, [&] { return play(library, *options); });
        };
    });
}

} // namespace host

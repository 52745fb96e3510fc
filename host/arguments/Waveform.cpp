#include "commands/Waveform.h"
#include "arguments/Arguments.h"
#include "base/Translation.h"

#include <memory>

namespace host {

void addWaveform(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SWaveformOptions>();
    CLI::App* command = app.add_subcommand(
        "waveform",
        tr("host.help.waveform",
           "Draw a sound file as a PNG image: peaks and, in a darker colour, the root mean square."));
    command->add_option("IN", options->input, tr("host.help.waveform.IN", "File to draw"))
        ->required()
        ->option_text(" ");
    command->add_option("-o,--output", options->output, tr("host.help.waveform.output", "PNG file to write"))
        ->required()
        ->option_text("FILE");
    command
        ->add_option("--width", options->width,
                     tr("host.help.waveform.width", "Width in pixels (default: 1200)"))
        ->option_text("N")
        ->check(CLI::Range(16, 32767));
    command
        ->add_option("--height", options->height,
                     tr("host.help.waveform.height", "Height in pixels (default: 300)"))
        ->option_text("N")
        ->check(CLI::Range(16, 32767));
    command->add_flag("-f,--force", options->force, tr("host.help.forceOne", "Replace an existing file"));
    command->callback(
        [options, &run] { run = [options](CLibrary& library) { return drawWaveform(library, *options); }; });
}

} // namespace host

#include "commands/Record.h"
#include "arguments/Arguments.h"
#include "base/Translation.h"
#include "media/Devices.h"

#include <memory>

namespace host {

void addRecord(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SRecordOptions>();
    CLI::App* command = app.add_subcommand(
        "record",
        tr("host.help.record",
           "Record a sound file until q or Ctrl-C is pressed (default: 44100 Hz, 2 channels, 16 bits). It "
           "is\nwritten as FILE.part and renamed to FILE at the end. A recording that is cut off, by a "
           "power\nfailure or a kill, remains as FILE.part and plays once it is renamed."));
    command
        ->add_option("-o,--output", options->output,
                     tr("host.help.output", "File to write; its extension selects the format"))
        ->required()
        ->option_text("FILE");
    command
        ->add_option("--device", options->device,
                     tr("host.help.record.device", "Device to record from, by its id in tonewright devices"))
        ->option_text("ID");
    command
        ->add_option("--seconds", options->seconds,
                     tr("host.help.record.seconds", "Stop after that many seconds"))
        ->option_text("S")
        ->check(CLI::Range(0.001, 1e9))
        ->check(isNumber);
    addFormat(*command, *options, {8, 16, 24});
    command->add_flag("-f,--force", options->force, tr("host.help.force", "Replace existing files"));
    addOutput(*command, options->show);
    command->callback([options, &run] {
        checkBitRates(*options);
        run = [options](CLibrary& library) {
            return needingDevice(options->show == EOutput::json, [&] { return record(library, *options); });
        };
    });
}

} // namespace host

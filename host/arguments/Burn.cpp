#include "commands/Burn.h"
#include "arguments/Arguments.h"
#include "base/Translation.h"

#include <memory>

namespace host {

namespace {

void addTarget(CLI::App& command, SBurnOptions& options) {
    auto* image =
        command
            .add_option("--image", options.image,
                        tr("host.help.burn.image",
                           "Disc image to write: a .cue of an audio CD, with its .bin beside it, or the .iso "
                           "of a\ndata disc"))
            ->option_text("FILE");
    auto* drive = command
                      .add_option("--drive", options.drive,
                                  tr("host.help.burn.drive", "Drive to write to, such as /dev/sr0"))
                      ->option_text("DRIVE")
                      ->excludes(image);
    auto* audio = command.add_flag_callback(
        "--audio", [&] { options.content = EDiscContent::audio; },
        tr("host.help.burn.audio", "Make an audio CD (default in a drive if all inputs are sound files)"));
    command
        .add_flag_callback(
            "--data", [&] { options.content = EDiscContent::data; },
            tr("host.help.burn.data", "Make a data disc"))
        ->excludes(audio);
    command
        .add_option(
            "--speed", options.speed,
            tr("host.help.burn.speed", "Speed in multiples of the speed of playing (default: the fastest)"))
        ->option_text("N")
        ->check(CLI::Range(1.0, 1000.0))
        ->check(isNumber)
        ->needs(drive);
    command
        .add_flag("--dummy", options.dummy, tr("host.help.burn.dummy", "Try it with the laser switched off"))
        ->needs(drive);
    command
        .add_flag("--blank", options.blank,
                  tr("host.help.burn.blank", "Erase a rewritable disc that is not empty first"))
        ->needs(drive);
}

} // namespace

void addBurn(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SBurnOptions>();
    CLI::App* command = app.add_subcommand(
        "burn",
        tr("host.help.burn",
           "Write sound files as an audio CD, or any files and folders as a data disc, to a disc image or "
           "to\na disc. Sound is converted to 44100 Hz, 2 channels and 16 bits. What was written is read "
           "back and\ncompared."));
    command
        ->add_option(
            "IN", options->inputs,
            tr("host.help.burn.IN", "Files in the order of the tracks, and folders with everything in them"))
        ->required()
        ->option_text("...");
    addTarget(*command, *options);
    command
        ->add_option(
            "--gap", options->gap,
            tr("host.help.burn.gap", "Seconds of silence before each track but the first (default: 2)"))
        ->option_text("S")
        ->check(CLI::Range(0.0, 300.0))
        ->check(isNumber);
    command->add_flag("--cd-text", options->cdText,
                      tr("host.help.burn.cdText", "Write titles and artists from the files' tags"));
    command
        ->add_option("--title", options->title,
                     tr("host.help.burn.title",
                        "Title of the disc (default: the album, or the name of the folder or of the image)"))
        ->option_text("TEXT");
    command->add_flag("-f,--force", options->force, tr("host.help.force", "Replace existing files"));
    addOutput(*command, options->show);
    command->callback([options, &run] {
        if (options->image.empty() && options->drive.empty())
            throw CLI::RequiredError(tr("host.Burn.eitherTarget", "Either --image or --drive"));
        run = [options](CLibrary& library) { return burn(library, *options); };
    });
}

} // namespace host

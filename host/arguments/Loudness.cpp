#include "commands/Loudness.h"
#include "arguments/Arguments.h"
#include "base/Translation.h"
#include "media/InputContent.h"

#include <algorithm>
#include <memory>
#include <unistd.h>

namespace host {

void addLoudness(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SLoudnessOptions>();
    CLI::App* command = app.add_subcommand(
        "loudness",
        tr("host.help.loudness",
           "Measure loudness and its range (EBU R 128), true peak, and the gain to a target, of every "
           "input and of\nall together. Where the peaks limit what convert --normalize would apply, that "
           "gain is shown as well."));
    command
        ->add_option("INPUT", options->inputs,
                     tr("host.help.loudness.INPUT",
                        "Files, http addresses, folders, playlists and cue sheets to measure, or - "
                        "for standard input"))
        ->required()
        ->option_text("...");
    command->add_flag("-r,--recursive", options->recursive,
                      tr("host.help.loudness.recursive", "Also measure what is in folders below a folder"));
    auto* target =
        command
            ->add_option("--target", options->target,
                         tr("host.help.loudness.target", "Loudness to reach, in LUFS (default: -18)"))
            ->option_text("LUFS")
            ->check(CLI::Validator(isLoudness, ""));
    command->add_flag_callback(
        "--no-album", [options] { options->album = false; },
        tr("host.help.loudness.noAlbum", "Do not measure all inputs together"));
    command
        ->add_flag(
            "--tag", options->tag,
            tr("host.help.loudness.tag",
               "Store the gains in the tags of the files, for players (ReplayGain; R128 in Opus files)"))
        ->excludes(target);
    addJobs(*command, options->jobs,
            tr("host.help.loudness.jobs", "Files measured at a time (default: number of processor cores)"));
    command->add_flag("--json", options->json, tr("host.help.json", "Print events as JSON, one per line"));
    command->callback([options, &run] {
        const auto standard = std::count_if(options->inputs.begin(), options->inputs.end(), isStandardStream);
        if (standard > 1)
            throw CLI::ValidationError(
                "-", tr("host.Loudness.standardOnce", "standard input can be read only once"));
        if (standard == 1 && ::isatty(STDIN_FILENO))
            throw CLI::ValidationError("-", tr("host.Convert.inputTerminal", "standard input is a terminal"));
        run = [options](CLibrary& library) { return showLoudness(library, *options); };
    });
}

} // namespace host

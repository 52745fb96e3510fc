#include "commands/Play.h"
#include "arguments/Arguments.h"
#include "base/Translation.h"
#include "media/Devices.h"

#include <charconv>
#include <memory>

namespace host {

namespace {

// Seconds, or [H:]M:S with seconds below 60.
double parseTime(const std::string& text) {
    const auto refuse = [&text] {
        throw CLI::ValidationError(
            "--start", tr("host.Play.time", "%TEXT% is not a time such as 1:02.5", {{"%TEXT%", text}}));
    };
    double seconds = 0;
    int parts = 0;
    for (const char *at = text.data(), *const end = at + text.size();; ++at, ++parts) {
        double part = 0;
        const auto [next, error] = std::from_chars(at, end, part, std::chars_format::fixed);
        if (error != std::errc() || !(part >= 0) || part > 1e9 || (parts > 0 && part >= 60)) refuse();
        seconds = seconds * 60 + part;
        at = next;
        if (at == end) return seconds;
        if (*at != ':' || parts == 2 || part != static_cast<int64_t>(part)) refuse();
    }
}

} // namespace

void addPlay(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SPlayOptions>();
    CLI::App* command = app.add_subcommand(
        "play", tr("host.help.play",
                   "Play sound files and arrangements (.xml) without gaps between them; also those in "
                   "folders, playlists\n(.m3u, .m3u8, .pls) and cue sheets (.cue). A file that fails is "
                   "reported and the next one is played.\n\nKeys:\n  space            pause and resume\n  "
                   "left, right      5 seconds back, forward\n  down, up         one minute back, forward; "
                   "also shift and left, right\n  n or >, p or <   next, previous item\n  + or 0, - or 9   "
                   "louder, softer\n  m                mute\n  q or Ctrl-C      stop"));
    command
        ->add_option(
            "INPUT", options->inputs,
            tr("host.help.play.INPUT", "Files, http addresses, folders, playlists and cue sheets to play"))
        ->required()
        ->option_text("...");
    command->add_flag("-r,--recursive", options->isRecursive,
                      tr("host.help.play.recursive", "Also play what is in folders below a folder"));
    command
        ->add_option(
            "--device", options->device,
            tr("host.help.play.device",
               "Device to play on, by its id or name in tonewright devices (default: the default device)"))
        ->option_text("ID|NAME");
    command
        ->add_option("--volume", options->volume,
                     tr("host.help.play.volume", "Volume in percent of the samples, from 0 to 130"))
        ->option_text("PERCENT")
        ->check(CLI::Range(0, kMostVolume));
    command
        ->add_option_function<std::string>(
            "--start", [options](const std::string& text) { options->start = parseTime(text); },
            tr("host.help.play.start", "Where to start in the first item, as 83.5 or 1:23.5"))
        ->option_text("TIME");
    command->add_flag("--shuffle", options->isShuffled, tr("host.help.play.shuffle", "Play in random order"));
    command->add_flag("--loop", options->loops,
                      tr("host.help.play.loop", "Start over at the end of the list"));
    addOutput(*command, options->show);
    command->callback([options, &run] {
        run = [options](CLibrary& library) {
            return needingDevice(options->show == EOutput::json, [&] { return play(library, *options); });
        };
    });
}

} // namespace host

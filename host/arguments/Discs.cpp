#include "arguments/Arguments.h"
#include "arguments/Cddb.h"
#include "base/Translation.h"
#include "commands/Drives.h"
#include "commands/ExtractFiles.h"
#include "commands/Rip.h"
#include "commands/ShowDisc.h"

#include <algorithm>
#include <memory>
#include <thread>

namespace host {

namespace {

std::string describePlace() {
    return tr("host.help.disc.place",
              "A drive by its path in tonewright drives, or a disc image (.cue, .toc, .nrg, "
              ".iso); by default the first drive with a disc");
}

// "1,3-5". Throws CLI::ValidationError.
std::set<int> parseTracks(const std::string& text) {
    std::set<int> tracks;
    std::istringstream parts(text);
    for (std::string part; std::getline(parts, part, ',');) {
        std::istringstream in(part);
        int first = -1, last = 0;
        char dash = 0, rest = 0;
        if (!(in >> first)) first = -1;
        last = first;
        if (in >> dash) in >> last;
        if (in.fail() && dash != 0) first = -1;
        if (first < 0 || last < first || last > 99 || (dash != 0 && dash != '-') || in >> rest)
            throw CLI::ValidationError("TRACKS",
                                       tr("host.Rip.badTracks",
                                          "%TEXT% is not a track or a range of tracks, such as 1,3-5",
                                          {{"%TEXT%", part}}));
        for (int track = first; track <= last; ++track) tracks.insert(track);
    }
    return tracks;
}

// "--cddb" and the options that only apply with it.
void addLookup(CLI::App& command, bool& looksUp, SCddbAccess& access, int& pick) {
    auto* const flag = command.add_flag(
        "--cddb", looksUp,
        tr("host.help.rip.cddb", "Take names and tags from a CDDB server; as in tonewright cddb:"));
    const std::vector<CLI::Option*> before = command.get_options();
    addCddbAccess(command, access);
    addCddbPick(command, pick);
    for (CLI::Option* const option : command.get_options())
        if (std::find(before.begin(), before.end(), option) == before.end()) option->needs(flag);
}

} // namespace

void addDrives(CLI::App& app, Run& run) {
    struct SOptions {
        bool json = false;
        bool watches = false;
    };
    const auto options = std::make_shared<SOptions>();
    CLI::App* command = app.add_subcommand(
        "drives",
        tr("host.help.drives",
           "List the drives for discs, and the folders of disc images in TONEWRIGHT_DRIVE_FOLDERS."));
    command->add_flag("--json", options->json, tr("host.help.jsonLines", "Print one JSON object per line"));
    command->add_flag(
        "-w,--watch", options->watches,
        tr("host.help.drives.watch", "Also print when a disc is put in or taken out, until Ctrl-C"));
    command->callback([options, &run] {
        run = [options](CLibrary& library) {
            return options->watches ? watchDrives(library, options->json) : listDrives(options->json);
        };
    });
}

void addDisc(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SExtractOptions>();
    CLI::App* command = app.add_subcommand(
        "disc", tr("host.help.disc", "Show the tracks, texts and files of a disc, or copy files from it."));
    command->add_option("DISC", options->place, describePlace())->option_text(" ");
    command->add_flag("--json", options->json, tr("host.help.jsonLines", "Print one JSON object per line"));
    auto* const extract =
        command
            ->add_option("-x,--extract", options->names,
                         tr("host.help.disc.extract",
                            "Copy these files, and folders with everything in them, instead; / is the whole "
                            "disc.\nFolders are separated by /"))
            ->option_text("FILE ...");
    command
        ->add_option("-d,--directory", options->directory,
                     tr("host.help.disc.directory", "Folder for the copies (default: the current one)"))
        ->option_text("FOLDER")
        ->needs(extract);
    command->add_flag("-f,--force", options->force, tr("host.help.force", "Replace existing files"))
        ->needs(extract);
    command->callback([options, &run] {
        run = [options](CLibrary& library) {
            return options->names.empty() ? showDisc(options->place, options->json)
                                          : extractFiles(library, *options);
        };
    });
}

void addRip(CLI::App& app, Run& run) {
    struct SOptions : SRipOptions {
        std::string tracksText;
        std::string pattern = "%track% %title%";
        bool looksUp = false;
        SCddbAccess access;
    };
    const auto options = std::make_shared<SOptions>();
    CLI::App* command =
        app.add_subcommand("rip", tr("host.help.rip", "Copy the audio tracks of a disc into sound files, "
                                                      "exactly sample for sample, with a report of each\n"
                                                      "track's CRC-32, length, repaired places and peak."));
    command->add_option("DISC", options->place, describePlace())->option_text(" ");
    command
        ->add_option(
            "TRACKS", options->tracksText,
            tr("host.help.rip.tracks",
               "Tracks to copy, such as 1,3-5, and 0 for the sound before track 1; by default all tracks"))
        ->option_text(" ");
    command
        ->add_option("--to", options->extension, tr("host.help.rip.to", "Type of the files (default: flac)"))
        ->option_text("EXT");
    command
        ->add_option("-d,--directory", options->directory,
                     tr("host.help.rip.directory", "Folder for the files (default: the current one)"))
        ->option_text("FOLDER");
    command
        ->add_option("--pattern", options->pattern,
                     tr("host.help.rip.pattern",
                        "Names of the files (default: \"%track% %title%\"); fields: %FIELDS%",
                        {{"%FIELDS%", CNamePattern::describeFields()}}))
        ->option_text("TEXT");
    command->add_flag("--verify", options->verify,
                      tr("host.help.rip.verify", "Read every track twice and compare"));
    command->add_flag(
        "--cue", options->writeCue,
        tr("host.help.rip.cue",
           "Also write a cue sheet; the files then hold the pregaps and the sound before track 1 as well"));
    command->add_flag("-f,--force", options->force, tr("host.help.rip.force", "Replace existing files"));
    addLookup(*command, options->looksUp, options->access, options->pick);
    options->jobs = static_cast<int>(std::max(std::thread::hardware_concurrency(), 1u));
    command
        ->add_option("-j,--jobs", options->jobs,
                     tr("host.help.rip.jobs",
                        "Tracks of a disc image copied at a time (default: number of processor cores)"))
        ->option_text("N")
        ->check(CLI::Range(1, 256));
    addFormat(*command, *options, {16});
    // The samples of the disc are copied as they are.
    for (const char* name : {"--rate", "--channels", "--bits"})
        command->remove_option(command->get_option(name));
    addOutput(*command, options->show);
    command->callback([options, &run] {
        checkBitRates(*options);
        if (options->looksUp) {
            requireCddbServer(options->access);
            options->cddb = options->access;
        }
        // The disc may be left out.
        const std::string place = options->place.native();
        std::error_code none;
        if (options->tracksText.empty() && !place.empty() && !std::filesystem::exists(place, none) &&
            place.find_first_not_of("0123456789,-") == std::string::npos) {
            options->tracksText = place;
            options->place.clear();
        }
        options->tracks = parseTracks(options->tracksText);
        try {
            options->names.emplace(options->pattern);
        } catch (const std::invalid_argument& error) {
            throw CLI::ValidationError("--pattern", error.what());
        }
        run = [options](CLibrary& library) { return rip(library, *options); };
    });
}

} // namespace host

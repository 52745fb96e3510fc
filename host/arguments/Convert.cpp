#include "commands/Convert.h"
#include "arguments/Arguments.h"
#include "arguments/Presets.h"
#include "base/Translation.h"
#include "media/InputContent.h"

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <stdexcept>
#include <unistd.h>
#include <utility>

namespace host {

namespace {

namespace fs = std::filesystem;

CNamePattern parsePattern(const std::string& text) {
    try {
        return CNamePattern(text);
    } catch (const std::invalid_argument& error) {
        throw CLI::ValidationError("--name", error.what());
    }
}

void addFiles(CLI::App& command, SConvertOptions& options) {
    command
        .add_option("IN", options.inputs,
                    tr("host.help.convert.IN",
                       "Files or http addresses to convert, folders with -r, or - for standard input"))
        ->required()
        ->option_text("...");
    command.add_flag("-r,--recursive", options.recursive,
                     tr("host.help.convert.recursive",
                        "Convert the files in and below folders; hidden ones are left out"));
    command
        .add_option("-o,--output", options.output,
                    tr("host.help.convert.output",
                       "File to write; its extension selects the format. With --to: a "
                       "folder,\nwhich exists or ends in /, or - for standard output"))
        ->option_text("FILE");
    command
        .add_option("--to", options.extension,
                    tr("host.help.convert.to",
                       "Extension of the files to write, such as flac; beside the inputs by default"))
        ->option_text("EXT");
    command
        .add_option(
            "--directory", options.directory,
            tr("host.help.convert.directory", "Folder for the files of --to; it is created if needed"))
        ->option_text("FOLDER")
        ->excludes("--output");
    command
        .add_option_function<std::string>(
            "--name", [&](const std::string& text) { options.names = parsePattern(text); },
            tr("host.help.convert.name",
               "Names of the files of --to from tags, such as '%artist%/%track% %title%';\nfolders are "
               "created, and the folders of the inputs are not kept. Fields:\n%FIELDS%",
               {{"%FIELDS%", CNamePattern::describeFields()}}))
        ->option_text("PATTERN");
}

void addExisting(CLI::App& command, SConvertOptions& options) {
    auto* force = command.add_flag_callback(
        "-f,--force", [&] { options.existing = EExisting::replace; },
        tr("host.help.force", "Replace existing files"));
    command
        .add_flag_callback(
            "--skip", [&] { options.existing = EExisting::skip; },
            tr("host.help.convert.skip", "Leave existing files as they are"))
        ->excludes(force);
    command.add_flag("-n,--dry-run", options.dryRun,
                     tr("host.help.convert.dryRun",
                        "Print what would be written where, and every problem; write nothing"));
}

void addCare(CLI::App& command, SConvertOptions& options) {
    command.add_flag("--salvage", options.salvage,
                     tr("host.help.convert.salvage",
                        "Replace damaged parts of the input with silence instead of failing"));
    command.add_flag("--prevent-clipping", options.preventClipping,
                     tr("host.help.convert.preventClipping",
                        "Make floating-point sound that exceeds full scale quieter instead of clipping it"));
    command.add_flag("--normalize{-18}")
        ->description(tr("host.help.convert.normalize",
                         "Bring each output to a loudness of -18 LUFS, or that of --normalize=LUFS;\nthe "
                         "gain is limited where peaks would exceed -1 dBTP"))
        ->check(CLI::Validator(isLoudness, ""))
        ->each([&](const std::string& text) { options.loudness = std::strtod(text.c_str(), nullptr); });
    command.add_flag("--album", options.oneGain,
                     tr("host.help.convert.album",
                        "Give all files the same gain, which brings them to that loudness together"));
    command.add_flag("--allow-clipping", options.allowClipping,
                     tr("host.help.convert.allowClipping", "Apply the gain of --normalize without a limit"));
    command.add_flag_callback(
        "--no-tags", [&] { options.carryTags = false; },
        tr("host.help.convert.noTags", "Do not copy title, artist and the other fields of tags"));
    command.add_flag("--times", options.carryTimes,
                     tr("host.help.convert.times", "Give each output the modification time of its input"));
}

// The parts of `output` that depend on --to.
void placeOutput(SConvertOptions& options) {
    const bool isFolder = options.output.native().ends_with('/');
    std::error_code none;
    if (options.output.empty() && options.extension.empty())
        throw CLI::RequiredError(tr("host.Convert.eitherOutput", "Either --output or --to"));
    // A preset may set --to, so this is not checked by the parser.
    if (options.extension.empty() && (!options.directory.empty() || options.names))
        throw CLI::RequiredError("--to");
    if (options.extension == "." || options.extension.find('/') != std::string::npos)
        throw CLI::ValidationError("--to", tr("host.Convert.extension", "takes an extension, such as flac"));
    if (isStandardStream(options.output)) {
        if (options.extension.empty())
            throw CLI::ValidationError("--output",
                                       tr("host.Convert.needsTo", "- needs --to, which selects the format"));
        if (options.show == EOutput::json)
            throw CLI::ValidationError(
                "--json", tr("host.Convert.jsonAndSound", "cannot share standard output with the sound"));
        if (!options.dryRun && ::isatty(STDOUT_FILENO))
            throw CLI::ValidationError("--output",
                                       tr("host.Convert.outputTerminal", "standard output is a terminal"));
    } else if (!options.output.empty() && options.extension.empty()) {
        if (isFolder)
            throw CLI::ValidationError("--output",
                                       tr("host.Convert.folderNeedsTo", "names a folder, which needs --to"));
    } else if (!options.output.empty()) {
        if (!isFolder && !fs::is_directory(options.output, none))
            throw CLI::ValidationError("--output",
                                       tr("host.Convert.folderWithTo",
                                          "with --to takes an existing folder, a name that ends in /, or -"));
        options.directory = std::exchange(options.output, fs::path());
    }
    if (!options.output.empty() && options.names)
        throw CLI::ValidationError(
            "--name", tr("host.Convert.nameNeedsTo", "names the files of --to, not a single output"));
    if (!options.output.empty() && (options.inputs.size() != 1 || options.recursive))
        throw CLI::ValidationError("--output",
                                   tr("host.Convert.oneInput", "takes one input; use --to for several"));
}

// "--normalize -14" is an option without a value and an input. A preset may set --normalize, so the parser
// does not check what needs it.
void checkLoudness(const CLI::App& command, const SConvertOptions& options) {
    for (const char* name : {"--album", "--allow-clipping"})
        if (!options.loudness && command.get_option(name)->count() > 0)
            throw CLI::RequiresError(name, "--normalize");
    for (const fs::path& input : options.inputs)
        if (options.loudness && input.native().starts_with('-') && isLoudness(input).empty())
            throw CLI::ValidationError("--normalize",
                                       tr("host.Convert.normalizeValue", "takes its value as in %OPTION%",
                                          {{"%OPTION%", "--normalize=" + input.native()}}));
}

void checkStandardInput(const SConvertOptions& options) {
    if (std::none_of(options.inputs.begin(), options.inputs.end(), isStandardStream)) return;
    if (options.inputs.size() > 1 || options.output.empty())
        throw CLI::ValidationError(
            "-", tr("host.Convert.onlyInput", "standard input is the only input and needs --output"));
    if (!options.dryRun && ::isatty(STDIN_FILENO))
        throw CLI::ValidationError("-", tr("host.Convert.inputTerminal", "standard input is a terminal"));
}

} // namespace

void addConvert(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SConvertOptions>();
    CLI::App* command = app.add_subcommand(
        "convert",
        tr("host.help.convert",
           "Convert sound files. Sample rate, channels and bits per sample stay those of the input "
           "unless\noptions change them or the target cannot hold them. Existing files are replaced only "
           "with\n--force. A file that fails is reported and the next one is converted."));
    addFiles(*command, *options);
    addPresets(*command);
    addFormat(*command, *options, {8, 16, 24, 32});
    command
        ->add_option("--resampler", options->resampler,
                     tr("host.help.convert.resampler",
                        "default, or best: a steeper filter for changes of the sample rate"))
        ->option_text("NAME")
        ->check(CLI::IsMember({"default", "best"}).description(""));
    addExisting(*command, *options);
    addCare(*command, *options);
    addJobs(*command, options->jobs,
            tr("host.help.convert.jobs", "Files converted at a time (default: number of processor cores)"));
    addOutput(*command, options->show);
    command->callback([options, command, &run] {
        applyPreset(*command);
        checkLoudness(*command, *options);
        placeOutput(*options);
        checkStandardInput(*options);
        checkBitRates(*options);
        run = [options](CLibrary& library) { return convert(library, *options); };
    });
}

} // namespace host

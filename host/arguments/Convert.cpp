#include "commands/Convert.h"
#include "arguments/Arguments.h"

#include <algorithm>
#include <memory>
#include <thread>

namespace host {

void addConvert(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SConvertOptions>();
    CLI::App* command = app.add_subcommand(
        "convert",
        "Convert sound files. Sample rate, channels and bits per sample stay those of the input unless\n"
        "options change them or the target cannot hold them. Existing files are replaced only with\n"
        "--force. A file that fails is reported and the next one is converted.");
    command->add_option("IN", options->inputs, "Files to convert")->required()->option_text("...");
    auto* output = command
                       ->add_option("-o,--output", options->output,
                                    "File to write; its extension selects the format (one input only)")
                       ->option_text("FILE");
    auto* to = command
                   ->add_option("--to", options->extension,
                                "Extension of the files to write, such as flac, beside the inputs")
                   ->option_text("EXT");
    output->excludes(to);
    command
        ->add_option("--directory", options->directory,
                     "Folder for the files of --to; it is created if needed")
        ->option_text("FOLDER")
        ->needs(to);
    addFormat(*command, *options, {8, 16, 24, 32});
    options->jobs = static_cast<int>(std::max(std::thread::hardware_concurrency(), 1u));
    command
        ->add_option("-j,--jobs", options->jobs,
                     "Files converted at a time (default: number of processor cores)")
        ->option_text("N")
        ->check(CLI::Range(1, 256));
    command->add_flag("-f,--force", options->force, "Replace existing files");
    command
        ->add_option("--resampler", options->resampler,
                     "default, or best: a steeper filter for changes of the sample rate")
        ->option_text("NAME")
        ->check(CLI::IsMember({"default", "best"}).description(""));
    command->add_flag("--salvage", options->salvage,
                      "Replace damaged parts of the input with silence instead of failing");
    command->add_flag_callback(
        "--no-tags", [options] { options->carryTags = false; },
        "Do not copy title, artist and the other fields of tags");
    addOutput(*command, options->show);
    command->callback([options, &run] {
        if (options->output.empty() == options->extension.empty())
            throw CLI::RequiredError("Either --output or --to");
        if (!options->output.empty() && options->inputs.size() != 1)
            throw CLI::ValidationError("--output", "takes one input; use --to for several");
        if (options->extension == "." || options->extension.find('/') != std::string::npos)
            throw CLI::ValidationError("--to", "takes an extension, such as flac");
        checkBitRates(*options);
        run = [options](CLibrary& library) { return convert(library, *options); };
    });
}

} // namespace host

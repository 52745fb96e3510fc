// tonewright: converts, plays, mixes and records sound files, shows their properties, draws their waveforms
// and changes their tags.
#include "Cancel.h"
#include "Commands.h"
#include "Devices.h"
#include "ExitCodes.h"
#include "FileTag.h"
#include "HostLog.h"
#include "Text.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <limits>
#include <map>
#include <set>
#include <thread>
#include <tonewright/host.h>

namespace {

using namespace host;

const std::map<std::string, int32_t> kLogLevels{
    {"trace", TONEWRIGHT_LOG_TRACE},     {"debug", TONEWRIGHT_LOG_DEBUG},
    {"info", TONEWRIGHT_LOG_INFO},       {"warning", TONEWRIGHT_LOG_WARNING},
    {"error", TONEWRIGHT_LOG_EXCEPTION}, {"off", std::numeric_limits<int32_t>::max()}};

using Run = std::function<int(CLibrary&)>;

// CLI::Range accepts NaN.
std::string isNumber(const std::string& text) {
    return std::isnan(std::strtod(text.c_str(), nullptr)) ? "is not a number" : "";
}

// The options of the output format.
void addFormat(CLI::App& command, SFormatOptions& options, const std::set<int>& widths) {
    command.add_option("--rate", options.rate, "Sample rate in Hz")
        ->option_text("HZ")
        ->check(CLI::Range(1, 768000));
    command.add_option("--channels", options.channels, "Number of channels")
        ->option_text("N")
        ->check(CLI::Range(1, 32));
    command
        .add_option("--bits", options.bits,
                    widths.size() == 1   ? "Bits per sample: 16"
                    : widths.size() == 4 ? "Bits per sample: 8, 16, 24 or 32"
                                         : "Bits per sample: 8, 16 or 24")
        ->option_text("N")
        ->check(CLI::IsMember(widths));
    command
        .add_option("--quality", options.quality,
                    "Quality from 0.0 (small) to 1.0 (best); FLAC: 1.0 is the best compression")
        ->option_text("Q")
        ->check(CLI::Range(0.0, 1.0))
        ->check(isNumber);
    const CLI::Range bitRates(1, 100'000'000);
    const auto units = CLI::AsNumberWithUnit(std::map<std::string, int>{{"k", 1000}},
                                             CLI::AsNumberWithUnit::CASE_INSENSITIVE);
    auto* bitRate = command.add_option("--bitrate", options.bitRate, "Bits per second, such as 192k")
                        ->option_text("N")
                        ->transform(units)
                        ->check(bitRates);
    command.add_option("--min-bitrate", options.minBitRate, "Minimum bits per second")
        ->option_text("N")
        ->transform(units)
        ->check(bitRates)
        ->needs(bitRate);
    command.add_option("--max-bitrate", options.maxBitRate, "Maximum bits per second")
        ->option_text("N")
        ->transform(units)
        ->check(bitRates)
        ->needs(bitRate);
}

void checkBitRates(const SFormatOptions& options) {
    if (options.minBitRate > options.bitRate)
        throw CLI::ValidationError("--min-bitrate", "is greater than --bitrate");
    if (options.maxBitRate > 0 && options.maxBitRate < options.bitRate)
        throw CLI::ValidationError("--max-bitrate", "is less than --bitrate");
}

// "--json" and "--quiet".
void addOutput(CLI::App& app, EOutput& show) {
    auto* json = app.add_flag_callback(
        "--json", [&] { show = EOutput::json; }, "Print events as JSON, one per line");
    app.add_flag_callback(
           "-q,--quiet", [&] { show = EOutput::quiet; }, "Print failures only")
        ->excludes(json);
}

void addConvert(CLI::App& app, SConvertOptions& options, Run& run) {
    CLI::App* command = app.add_subcommand(
        "convert",
        "Convert sound files. Sample rate, channels and bits per sample stay those of the input unless\n"
        "options change them or the target cannot hold them. Existing files are replaced only with\n"
        "--force. A file that fails is reported and the next one is converted.");
    command->add_option("IN", options.inputs, "Files to convert")->required()->option_text("...");
    auto* output = command
                       ->add_option("-o,--output", options.output,
                                    "File to write; its extension selects the format (one input only)")
                       ->option_text("FILE");
    auto* to = command
                   ->add_option("--to", options.extension,
                                "Extension of the files to write, such as flac, beside the inputs")
                   ->option_text("EXT");
    output->excludes(to);
    command
        ->add_option("--directory", options.directory,
                     "Folder for the files of --to; it is created if needed")
        ->option_text("FOLDER")
        ->needs(to);
    addFormat(*command, options, {8, 16, 24, 32});
    options.jobs = static_cast<int>(std::max(std::thread::hardware_concurrency(), 1u));
    command
        ->add_option("-j,--jobs", options.jobs,
                     "Files converted at a time (default: number of processor cores)")
        ->option_text("N")
        ->check(CLI::Range(1, 256));
    command->add_flag("-f,--force", options.force, "Replace existing files");
    command
        ->add_option("--resampler", options.resampler,
                     "default, or best: a steeper filter for changes of the sample rate")
        ->option_text("NAME")
        ->check(CLI::IsMember({"default", "best"}).description(""));
    command->add_flag("--salvage", options.salvage,
                      "Replace damaged parts of the input with silence instead of failing");
    command->add_flag_callback(
        "--no-tags", [&] { options.carryTags = false; },
        "Do not copy title, artist and the other fields of tags");
    addOutput(*command, options.show);
    command->callback([&] {
        if (options.output.empty() == options.extension.empty())
            throw CLI::RequiredError("Either --output or --to");
        if (!options.output.empty() && options.inputs.size() != 1)
            throw CLI::ValidationError("--output", "takes one input; use --to for several");
        if (options.extension == "." || options.extension.find('/') != std::string::npos)
            throw CLI::ValidationError("--to", "takes an extension, such as flac");
        checkBitRates(options);
        run = [&](CLibrary& library) { return convert(library, options); };
    });
}

void addInfo(CLI::App& app, std::vector<std::filesystem::path>& files, bool& json, Run& run) {
    CLI::App* command = app.add_subcommand(
        "info", "Show duration, sample rate, channels and bits per sample of sound files.");
    command->add_option("FILE", files, "Files to examine")->required()->option_text("...");
    command->add_flag("--json", json, "Print one JSON object per line");
    command->callback([&] { run = [&](CLibrary& library) { return showInfo(library, files, json); }; });
}

void addFormats(CLI::App& app, bool& json, Run& run) {
    CLI::App* command = app.add_subcommand("formats", "List the file extensions that can be read.");
    command->add_flag("--json", json, "Print one JSON object");
    command->callback([&] { run = [&](CLibrary& library) { return listFormats(library, json); }; });
}

void addWaveform(CLI::App& app, SWaveformOptions& options, Run& run) {
    CLI::App* command = app.add_subcommand(
        "waveform", "Draw a sound file as a PNG image: peaks and, in a darker colour, the root mean square.");
    command->add_option("IN", options.input, "File to draw")->required()->option_text(" ");
    command->add_option("-o,--output", options.output, "PNG file to write")->required()->option_text("FILE");
    command->add_option("--width", options.width, "Width in pixels (default: 1200)")
        ->option_text("N")
        ->check(CLI::Range(16, 32767));
    command->add_option("--height", options.height, "Height in pixels (default: 300)")
        ->option_text("N")
        ->check(CLI::Range(16, 32767));
    command->add_flag("-f,--force", options.force, "Replace an existing file");
    command->callback([&] { run = [&](CLibrary& library) { return drawWaveform(library, options); }; });
}

void addDevices(CLI::App& app, bool& json, Run& run) {
    CLI::App* command = app.add_subcommand("devices", "List the sound devices that play and record.");
    command->add_flag("--json", json, "Print one JSON object per line");
    command->callback(
        [&] { run = [&](CLibrary&) { return needingDevice(json, [&] { return listDevices(json); }); }; });
}

void addPlay(CLI::App& app, SPlayOptions& options, Run& run) {
    CLI::App* command = app.add_subcommand(
        "play",
        "Play sound files and arrangements (.xml) on the default device. Space pauses and resumes, q or\n"
        "Ctrl-C stops. A file that fails is reported and the next one is played.");
    command->add_option("FILE", options.files, "Files to play")->required()->option_text("...");
    addOutput(*command, options.show);
    command->callback([&] {
        run = [&](CLibrary& library) {
            return needingDevice(options.show == EOutput::json, [&] { return play(library, options); });
        };
    });
}

void addMix(CLI::App& app, SMixOptions& options, Run& run) {
    CLI::App* command = app.add_subcommand(
        "mix",
        "Mix an editor's arrangement into one sound file (default: 44100 Hz, 2 channels). Relative URIs\n"
        "in it are resolved against its folder.");
    command->add_option("ARRANGEMENT", options.input, "XML file that describes the tracks")
        ->required()
        ->option_text(" ");
    command->add_option("-o,--output", options.output, "File to write; its extension selects the format")
        ->required()
        ->option_text("FILE");
    addFormat(*command, options, {16});
    command->add_flag("-f,--force", options.force, "Replace existing files");
    addOutput(*command, options.show);
    command->callback([&] {
        checkBitRates(options);
        run = [&](CLibrary& library) { return mix(library, options); };
    });
}

void addRecord(CLI::App& app, SRecordOptions& options, Run& run) {
    CLI::App* command = app.add_subcommand(
        "record",
        "Record a sound file until q or Ctrl-C is pressed (default: 44100 Hz, 2 channels, 16 bits). It is\n"
        "written as FILE.part and renamed to FILE at the end. A recording that is cut off, by a power\n"
        "failure or a kill, remains as FILE.part and plays once it is renamed.");
    command->add_option("-o,--output", options.output, "File to write; its extension selects the format")
        ->required()
        ->option_text("FILE");
    command->add_option("--device", options.device, "Device to record from, by its id in tonewright devices")
        ->option_text("ID");
    command->add_option("--seconds", options.seconds, "Stop after that many seconds")
        ->option_text("S")
        ->check(CLI::Range(0.001, 1e9))
        ->check(isNumber);
    addFormat(*command, options, {8, 16, 24});
    command->add_flag("-f,--force", options.force, "Replace existing files");
    addOutput(*command, options.show);
    command->callback([&] {
        checkBitRates(options);
        run = [&](CLibrary& library) {
            return needingDevice(options.show == EOutput::json, [&] { return record(library, options); });
        };
    });
}

void addTag(CLI::App& app, SSetTagOptions& options, std::vector<std::string>& cleared, Run& run) {
    CLI::App* command = app.add_subcommand(
        "tag",
        "Show or change title, artist and the other fields of mp3, flac, ogg, wav, wma and asf files.");
    command->require_subcommand(1);
    CLI::App* show = command->add_subcommand("show", "Show the fields of tags.");
    CLI::App* set = command->add_subcommand(
        "set",
        "Change fields of tags. A file is written only if a field changes, and then completely or not at\n"
        "all. A file that fails is reported and the next one is changed.");
    for (CLI::App* each : {show, set}) {
        each->add_option("FILE", options.files, "Files with tags")->required()->option_text("...");
        each->add_flag("--json", options.json, "Print one JSON object per line");
    }
    std::vector<std::string> names{"all"};
    for (const STagField& field : getTagFields()) {
        names.push_back(field.name);
        const std::string option = std::string("--") + field.name;
        const auto take = [&options, name = field.name, option](const std::string& text) {
            const std::optional<std::u16string> wide = toUTF16(text);
            if (!wide) throw CLI::ValidationError(option, "is not UTF-8");
            options.fields[name] = *wide;
        };
        set->add_option_function<std::string>(
               option, take, std::string("The ") + field.title + "; an empty text removes it")
            ->option_text("TEXT");
    }
    set->add_option("--clear", cleared, "Remove a field, or all; may be repeated")
        ->option_text("FIELD")
        ->check(CLI::IsMember(names).description(""))
        ->allow_extra_args(false);
    show->callback(
        [&] { run = [&](CLibrary& library) { return showTags(library, options.files, options.json); }; });
    set->callback([&] {
        const bool clearsAll = std::find(cleared.begin(), cleared.end(), "all") != cleared.end();
        for (const STagField& field : getTagFields()) {
            const bool clears = std::find(cleared.begin(), cleared.end(), field.name) != cleared.end();
            if (clears && options.fields.count(field.name))
                throw CLI::ValidationError("--clear", std::string(field.name) + " cannot be set and cleared");
            if (clears || clearsAll) options.fields.try_emplace(field.name);
        }
        if (options.fields.empty()) throw CLI::RequiredError("A field to set or to clear");
        run = [&](CLibrary& library) { return setTags(library, options); };
    });
}

// In the parser's order, last argument first. "--title=" is split into the option and an empty value, since
// the parser would otherwise take the next argument as the value.
std::vector<std::string> splitArguments(int argc, char** argv) {
    std::vector<std::string> arguments;
    bool hasOptions = true;
    for (const std::string& argument : std::vector<std::string>(argv + 1, argv + argc)) {
        hasOptions = hasOptions && argument != "--";
        if (hasOptions && argument.starts_with("--") && argument.find('=') == argument.size() - 1)
            arguments.insert(arguments.end(), {argument.substr(0, argument.size() - 1), ""});
        else
            arguments.push_back(argument);
    }
    std::reverse(arguments.begin(), arguments.end());
    return arguments;
}

// Exceptions that the commands do not catch are failures of the job, not of loading the library.
int runCommand(const Run& run, CLibrary& library) {
    try {
        const int code = run(library);
        requireOutput();
        return code;
    } catch (const CNoDevice& failure) {
        std::fprintf(stderr, "tonewright: %s\n", failure.what());
        return kExitNoDevice;
    } catch (const std::exception& failure) {
        std::error_code error;
        const bool isGone = std::filesystem::current_path(error).empty();
        std::fprintf(stderr, "tonewright: %s\n",
                     isGone ? "The current folder does not exist" : failure.what());
        return kExitFailure;
    }
}

} // namespace

int main(int argc, char** argv) {
    CLI::App app(
        "Converts, plays, mixes and records sound files, shows their properties, draws their waveforms "
        "and changes their tags.",
        "tonewright");
    app.set_version_flag("--version", "tonewright " TONEWRIGHT_VERSION);
    app.require_subcommand(1);
    app.get_formatter()->column_width(28);
    int32_t printLevel = std::numeric_limits<int32_t>::max();
    app.add_option("--log-level", printLevel,
                   "Print the library's log from this level on: trace, debug, info, warning, error or off")
        ->option_text("LEVEL")
        ->transform(CLI::CheckedTransformer(kLogLevels, CLI::ignore_case).description(""));
    app.footer(
        "Exit codes: 0 success, 1 a file failed, 2 invalid arguments, 3 no sound device, 4 the library "
        "cannot be loaded or started, 130 stopped by Ctrl-C.");

    SConvertOptions convertOptions;
    SWaveformOptions waveformOptions;
    SPlayOptions playOptions;
    SMixOptions mixOptions;
    SRecordOptions recordOptions;
    SSetTagOptions tagOptions;
    std::vector<std::string> clearedFields;
    std::vector<std::filesystem::path> infoFiles;
    bool json = false;
    Run run;
    addConvert(app, convertOptions, run);
    addInfo(app, infoFiles, json, run);
    addFormats(app, json, run);
    addWaveform(app, waveformOptions, run);
    addDevices(app, json, run);
    addPlay(app, playOptions, run);
    addMix(app, mixOptions, run);
    addRecord(app, recordOptions, run);
    addTag(app, tagOptions, clearedFields, run);
    // The parser's own message would not name the unknown command.
    const auto isMeant = [&](const CLI::App* command) { return command->check_name(argv[1]); };
    if (argc > 1 && argv[1][0] != '-' && app.get_subcommands(isMeant).empty()) {
        std::fprintf(stderr, "Unknown command: %s\nRun with --help for more information.\n",
                     toPrintable(argv[1]).c_str());
        return kExitUsage;
    }
    try {
        app.parse(splitArguments(argc, argv));
    } catch (const CLI::ParseError& error) {
        return app.exit(error) == 0 ? kExitSuccess : kExitUsage;
    }

    // Other programs stop reading the fields of a WAV file at one of odd length without padding.
    ::setenv("TONEWRIGHT_PAD_INFO", "1", 0);
    try {
        watchForCancel();
        CLibrary library;
        CHostLog log(library, printLevel);
        library.start();
        return runCommand(run, library);
    } catch (const std::exception& error) {
        std::fprintf(stderr, "tonewright: %s\n", error.what());
        return kExitNoLibrary;
    }
}

// tonewright-covers: shows, paints and converts graphic documents, such as covers and labels of discs.
#include "Convert.h"
#include "Images.h"
#include "Info.h"
#include "Render.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Translation.h"
#include "parser/Parser.h"

#include <functional>
#include <memory>

namespace {

using namespace host;
using namespace host::covers;

using Run = std::function<int()>;

template <size_t N>
std::function<std::string(const std::string&)> endsInOneOf(const char* const (&types)[N]) {
    return [&types](const std::string& name) -> std::string {
        const std::string extension = std::filesystem::path(name).extension();
        std::string list;
        for (const char* const type : types) {
            if (extension == type) return "";
            list += (list.empty() ? "" : ", ") + std::string(type);
        }
        return tr("host.Covers.extension", "%FILE% does not end in one of %LIST%",
                  {{"%FILE%", name}, {"%LIST%", list}});
    };
}

template <class Options> void addFile(CLI::App& command, Options& options) {
    command
        .add_option("FILE", options.file,
                    tr("host.help.covers.FILE", "Project, template, theme or cover graphics"))
        ->required()
        ->option_text(" ");
}

template <class Options>
void addFileNames(CLI::App& command, Options& options, const std::string& description) {
    command.add_flag("--file-names", options.hasFileNames, description);
}

void addInfo(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SInfoOptions>();
    CLI::App* const command = app.add_subcommand(
        "info", tr("host.help.covers.info", "Show the kind of files, their designs and attachments."));
    command->add_option("FILES", options->files, tr("host.help.covers.info.FILES", "Files to show"))
        ->required()
        ->option_text(" ");
    command->add_flag("--json", options->isJson, tr("host.help.jsonLines", "Print one JSON object per line"));
    command->callback([options, &run] { run = [options] { return showInfo(*options); }; });
}

void addRender(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SRenderRequest>();
    CLI::App* const command = app.add_subcommand(
        "render", tr("host.help.covers.render",
                     "Paint a design as a PNG picture, a page of PDF or SVG. No display is needed."));
    addFile(*command, *options);
    command
        ->add_option(
            "-o,--output", options->output,
            tr("host.help.covers.render.output", "File to write; its extension .png, .pdf or .svg decides"))
        ->required()
        ->option_text("FILE")
        ->check(endsInOneOf(kPictureTypes));
    CLI::Option* const dpi =
        command
            ->add_option("--dpi", options->dpi,
                         tr("host.help.covers.render.dpi", "Pixels per inch of a PNG picture (default: 300)"))
            ->option_text("N")
            ->check(CLI::Range(1.0, 4800.0))
            ->check(isNumber);
    command
        ->add_option("--target", options->target,
                     tr("host.help.covers.render.target",
                        "What the design is for: dvd-case, booklet, slim-case, jewel-case, blu-ray-case or "
                        "disc, or the\n"
                        "number 1 to 6 in this order (default: the first that has a design)"))
        ->option_text("NAME");
    command
        ->add_option(
            "--item", options->item,
            tr("host.help.covers.render.item", "Number of the design if there are several (default: 1)"))
        ->option_text("N")
        ->check(CLI::Range(1, 100000));
    command->add_flag("--grey", options->isGrey,
                      tr("host.help.covers.render.grey", "Paint in shades of grey"));
    addFileNames(*command, *options,
                 tr("host.help.covers.render.fileNames",
                    "Take pictures of an exported project from the files that it names"));
    command->add_flag("-f,--force", options->force, tr("host.help.forceOne", "Replace an existing file"));
    command->callback([options, dpi, &run] {
        if (dpi->count() > 0 && options->output.extension() != ".png")
            throw CLI::ValidationError("--dpi", tr("host.Covers.dpi", "applies to .png files only"));
        run = [options] { return renderDesign(*options); };
    });
}

void addConvert(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SConvertRequest>();
    CLI::App* const command =
        app.add_subcommand("convert", tr("host.help.covers.convert",
                                         "Convert between projects (.cedprj) and exported projects (.xml)."));
    addFile(*command, *options);
    command
        ->add_option(
            "-o,--output", options->output,
            tr("host.help.covers.convert.output", "File to write; its extension .cedprj or .xml decides"))
        ->required()
        ->option_text("FILE")
        ->check(endsInOneOf(kProjectTypes));
    command->add_flag(
        "--lossless", options->isLossless,
        tr("host.help.covers.convert.lossless", "Store pictures of a project as PNG instead of JPEG"));
    addFileNames(*command, *options,
                 tr("host.help.covers.convert.fileNames",
                    "Exported projects: take pictures from the files that they "
                    "name, and do not store those that exist"));
    command->add_flag("-f,--force", options->force, tr("host.help.forceOne", "Replace an existing file"));
    command->callback([options, &run] {
        if (options->isLossless && options->output.extension() != ".cedprj")
            throw CLI::ValidationError("--lossless",
                                       tr("host.Covers.lossless", "applies to .cedprj files only"));
        run = [options] { return convertProject(*options); };
    });
}

void addImages(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SImagesRequest>();
    CLI::App* const command = app.add_subcommand(
        "images", tr("host.help.covers.images",
                     "Copy the pictures, texts and other attachments of a project to files."));
    addFile(*command, *options);
    command
        ->add_option(
            "-d,--directory", options->folder,
            tr("host.help.covers.images.directory", "Folder for the files; created if it does not exist"))
        ->required()
        ->option_text("FOLDER");
    command->add_flag("-f,--force", options->force, tr("host.help.force", "Replace existing files"));
    command->callback([options, &run] { run = [options] { return writeImages(*options); }; });
}

} // namespace

int main(int argc, char** argv) {
    if (!chooseLanguage("tonewright-covers", argc, argv)) return kExitUsage;
    CLI::App app(tr("host.help.covers", "Shows, paints and converts covers and labels of discs."),
                 "tonewright-covers");
    addCommonOptions(app, "tonewright-covers " TONEWRIGHT_VERSION);
    addLanguage(app);
    app.footer(tr("host.help.covers.exitCodes",
                  "Exit codes: 0 success, 1 a file failed, 2 invalid arguments, 130 stopped by Ctrl-C."));
    Run run;
    for (const auto add : {addInfo, addRender, addConvert, addImages}) add(app, run);
    if (const std::optional<int> code = parseArguments(app, argc, argv)) return *code;
    watchForCancel();
    try {
        return run();
    } catch (const std::exception& error) {
        std::fprintf(stderr, "tonewright-covers: %s\n", error.what());
        return kExitFailure;
    }
}

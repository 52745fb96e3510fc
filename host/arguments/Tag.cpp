#include "commands/Tag.h"
#include "arguments/Arguments.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "commands/TagCover.h"
#include "commands/TagNames.h"
#include "media/FileTag.h"

#include <algorithm>
#include <memory>

namespace host {

namespace {

std::u16string requireText(const std::string& option, const std::string& text) {
    const std::optional<std::u16string> wide = toUTF16(text);
    if (!wide) throw CLI::ValidationError(option, tr("host.Tag.notUTF8", "is not UTF-8"));
    return *wide;
}

void addFiles(CLI::App& command, std::vector<std::filesystem::path>& files, bool& json) {
    command.add_option("FILE", files, tr("host.help.tag.FILE", "Files with tags"))
        ->required()
        ->option_text("...");
    command.add_flag("--json", json, tr("host.help.jsonLines", "Print one JSON object per line"));
}

void addShow(CLI::App& tag, Run& run) {
    const auto options = std::make_shared<SShowTagOptions>();
    CLI::App* show = tag.add_subcommand("show", tr("host.help.tag.show", "Show the fields of tags."));
    addFiles(*show, options->files, options->json);
    show->add_flag("--all", options->all,
                   tr("host.help.tag.show.all",
                      "Show every field under its own name, all of its values, and the pictures"));
    show->callback(
        [options, &run] { run = [options](CLibrary& library) { return showTags(library, *options); }; });
}

void addSet(CLI::App& tag, Run& run) {
    const auto options = std::make_shared<SSetTagOptions>();
    const auto cleared = std::make_shared<std::vector<std::string>>();
    CLI::App* set = tag.add_subcommand(
        "set", tr("host.help.tag.set",
                  "Change fields of tags. A file is written only if a field changes, and then completely or "
                  "not at\nall. A file that fails is reported and the next one is changed."));
    addFiles(*set, options->files, options->json);
    std::vector<std::string> names{"all"};
    for (const STagField& field : getTagFields()) {
        names.push_back(field.name);
        const std::string option = std::string("--") + field.name;
        const auto take = [options, name = field.name, option](const std::string& text) {
            options->fields.usual[name] = requireText(option, text);
        };
        set->add_option_function<std::string>(option, take,
                                              tr("host.help.tag.set.usual",
                                                 "The %FIELD%; an empty text removes it",
                                                 {{"%FIELD%", getTitle(field)}}))
            ->option_text("TEXT");
    }
    const auto takeOther = [options](const std::vector<std::string>& texts) {
        for (const std::string& text : texts) {
            const size_t equals = text.find('=');
            const std::string name = text.substr(0, equals);
            const auto isUsual = [](char c) { return c >= ' ' && c <= '}'; };
            if (equals == std::string::npos || name.empty() ||
                !std::all_of(name.begin(), name.end(), isUsual))
                throw CLI::ValidationError(
                    "--field",
                    tr("host.Tag.nameAndText", "must be NAME=TEXT, with a name in ASCII characters"));
            requireText("--field", text);
            options->fields.others.emplace_back(name, text.substr(equals + 1));
        }
    };
    set->add_option_function<std::vector<std::string>>(
           "--field", takeOther,
           tr("host.help.tag.set.field", "Any field, such as COMPOSER=Bach; repeated with the same name, a "
                                         "further value. An empty text removes the field"))
        ->option_text("NAME=TEXT")
        ->allow_extra_args(false);
    set->add_option("--clear", *cleared,
                    tr("host.help.tag.set.clear", "Remove a field, or all of the above; may be repeated"))
        ->option_text("FIELD")
        ->check(CLI::IsMember(names).description(""))
        ->allow_extra_args(false);
    set->callback([options, cleared, &run] {
        STagFields& fields = options->fields;
        const bool clearsAll = std::find(cleared->begin(), cleared->end(), "all") != cleared->end();
        for (const STagField& field : getTagFields()) {
            const bool clears = std::find(cleared->begin(), cleared->end(), field.name) != cleared->end();
            if (clears && fields.usual.count(field.name))
                throw CLI::ValidationError("--clear",
                                           tr("host.Tag.setAndCleared", "%FIELD% cannot be set and cleared",
                                              {{"%FIELD%", field.name}}));
            if (clears || clearsAll) fields.usual.try_emplace(field.name);
        }
        if (fields.usual.empty() && fields.others.empty())
            throw CLI::RequiredError(tr("host.Tag.noField", "A field to set or to clear"));
        run = [options](CLibrary& library) { return setTags(library, *options); };
    });
}

void addCopy(CLI::App& tag, Run& run) {
    const auto options = std::make_shared<SCopyTagOptions>();
    CLI::App* copy = tag.add_subcommand(
        "copy",
        tr("host.help.tag.copy",
           "Copy all fields and pictures of one file to others. Fields that only the others have stay."));
    copy->add_option("FROM", options->from, tr("host.help.tag.copy.FROM", "The file to copy from"))
        ->required()
        ->option_text(" ");
    copy->add_option("TO", options->to, tr("host.help.tag.copy.TO", "The files to change"))
        ->required()
        ->option_text("...");
    copy->add_flag("--json", options->json, tr("host.help.jsonLines", "Print one JSON object per line"));
    copy->callback([options, &run] { run = [options](CLibrary&) { return copyTags(*options); }; });
}

void addCover(CLI::App& tag, Run& run) {
    const auto options = std::make_shared<SCoverOptions>();
    CLI::App* cover = tag.add_subcommand(
        "cover", tr("host.help.tag.cover", "Show, export, import or remove the pictures of tags."));
    cover->require_subcommand(1);
    CLI::App* show =
        cover->add_subcommand("show", tr("host.help.tag.cover.show",
                                         "List the pictures: type, format, size in pixels and in bytes."));
    CLI::App* get = cover->add_subcommand(
        "export",
        tr("host.help.tag.cover.export",
           "Write a picture to a file: the front cover or otherwise the first one, unless --type is given."));
    CLI::App* put = cover->add_subcommand("import", tr("host.help.tag.cover.import",
                                                       "Add a JPEG, PNG, GIF, BMP or WebP file as the front "
                                                       "cover, or another type, in place of the old one."));
    CLI::App* remove = cover->add_subcommand(
        "remove", tr("host.help.tag.cover.remove", "Remove all pictures, or those of a type."));
    const auto add = [&](CLI::App* command, int (*start)(const SCoverOptions&)) {
        command->callback(
            [options, start, &run] { run = [options, start](CLibrary&) { return start(*options); }; });
    };
    for (CLI::App* each : {show, put, remove}) addFiles(*each, options->files, options->json);
    get->add_option("FILE", options->files, tr("host.help.tag.cover.FILE", "File with a tag"))
        ->required()
        ->expected(1)
        ->option_text(" ");
    get->add_flag("--json", options->json, tr("host.help.jsonObject", "Print a JSON object"));
    get->add_option("-o,--output", options->picture, tr("host.help.tag.cover.picture", "The picture file"))
        ->required()
        ->option_text("FILE");
    get->add_flag("-f,--force", options->force, tr("host.help.forceOne", "Replace an existing file"));
    put->add_option("-i,--input", options->picture, tr("host.help.tag.cover.picture", "The picture file"))
        ->required()
        ->option_text("FILE");
    for (CLI::App* each : {get, put, remove})
        each->add_option(
                "--type", options->type,
                tr("host.help.tag.cover.type", "The type: front, back, leaflet, media, artist, other, ..."))
            ->option_text("TYPE")
            ->transform(CLI::CheckedTransformer(getPictureTypes(), CLI::ignore_case).description(""));
    add(show, showCovers);
    add(get, exportCover);
    add(put, importCover);
    add(remove, removeCovers);
}

void addNames(CLI::App& tag, Run& run) {
    CLI::App* fromName = tag.add_subcommand(
        "from-name",
        tr("host.help.tag.fromName",
           "Set fields from the names of files. A pattern with slashes also reads the names of folders."));
    CLI::App* rename = tag.add_subcommand(
        "rename", tr("host.help.tag.rename", "Name files after their fields. A pattern with slashes creates "
                                             "folders. No file is ever replaced."));
    for (CLI::App* command : {fromName, rename}) {
        const auto options = std::make_shared<STagNameOptions>();
        addFiles(*command, options->files, options->json);
        const auto take = [options, reads = command == fromName](const std::string& pattern) {
            try {
                options->pattern.emplace(pattern);
            } catch (const std::invalid_argument& error) {
                throw CLI::ValidationError("--pattern", error.what());
            }
            if (reads && !options->pattern->canMatch())
                throw CLI::ValidationError("--pattern",
                                           tr("host.Tag.pattern", "needs other text between its fields"));
        };
        command
            ->add_option_function<std::string>("-p,--pattern", take,
                                               tr("host.help.tag.pattern",
                                                  "Such as '%track% - %title%'; fields are %FIELDS%",
                                                  {{"%FIELDS%", CNamePattern::describeFields()}}))
            ->required()
            ->option_text("PATTERN");
        command->add_flag("-n,--dry-run", options->dryRun,
                          tr("host.help.tag.dryRun", "Show what would be done and change nothing"));
        if (command == rename)
            command
                ->add_option("-d,--directory", options->directory,
                             tr("host.help.tag.rename.directory",
                                "The folder for the new names, instead of each file's own"))
                ->option_text("FOLDER")
                ->check(CLI::ExistingDirectory.description(""));
        const auto start = command == rename ? renameByTags : setTagsFromNames;
        command->callback([options, start, &run] {
            run = [options, start](CLibrary& library) { return start(library, *options); };
        });
    }
}

} // namespace

void addTag(CLI::App& app, Run& run) {
    CLI::App* command = app.add_subcommand(
        "tag",
        tr("host.help.tag", "Show or change title, artist, cover and all other fields of mp3, flac, ogg, "
                            "oga, opus, spx, m4a, mp4,\nwav, aiff, wma, asf, ape, wv, mpc and tta files."));
    command->require_subcommand(1);
    addShow(*command, run);
    addSet(*command, run);
    addCopy(*command, run);
    addCover(*command, run);
    addNames(*command, run);
}

} // namespace host

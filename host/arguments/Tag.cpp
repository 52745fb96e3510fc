#include "commands/Tag.h"
#include "arguments/Arguments.h"
#include "base/Text.h"
#include "media/FileTag.h"

#include <algorithm>
#include <memory>

namespace host {

void addTag(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SSetTagOptions>();
    const auto cleared = std::make_shared<std::vector<std::string>>();
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
        each->add_option("FILE", options->files, "Files with tags")->required()->option_text("...");
        each->add_flag("--json", options->json, "Print one JSON object per line");
    }
    std::vector<std::string> names{"all"};
    for (const STagField& field : getTagFields()) {
        names.push_back(field.name);
        const std::string option = std::string("--") + field.name;
        const auto take = [options, name = field.name, option](const std::string& text) {
            const std::optional<std::u16string> wide = toUTF16(text);
            if (!wide) throw CLI::ValidationError(option, "is not UTF-8");
            options->fields[name] = *wide;
        };
        set->add_option_function<std::string>(
               option, take, std::string("The ") + field.title + "; an empty text removes it")
            ->option_text("TEXT");
    }
    set->add_option("--clear", *cleared, "Remove a field, or all; may be repeated")
        ->option_text("FIELD")
        ->check(CLI::IsMember(names).description(""))
        ->allow_extra_args(false);
    show->callback([options, &run] {
        run = [options](CLibrary& library) { return showTags(library, options->files, options->json); };
    });
    set->callback([options, cleared, &run] {
        const bool clearsAll = std::find(cleared->begin(), cleared->end(), "all") != cleared->end();
        for (const STagField& field : getTagFields()) {
            const bool clears = std::find(cleared->begin(), cleared->end(), field.name) != cleared->end();
            if (clears && options->fields.count(field.name))
                throw CLI::ValidationError("--clear", std::string(field.name) + " cannot be set and cleared");
            if (clears || clearsAll) options->fields.try_emplace(field.name);
        }
        if (options->fields.empty()) throw CLI::RequiredError("A field to set or to clear");
        run = [options](CLibrary& library) { return setTags(library, *options); };
    });
}

} // namespace host

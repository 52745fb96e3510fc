#include "commands/Tag.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "commands/ForEachFile.h"
#include "library/Failure.h"
#include "media/FileTag.h"
#include "media/SoundFile.h"
#include "terminal/Progress.h"

#include <algorithm>
#include <cstdio>
#include <stdexcept>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr size_t kTitleColumns = 14;

std::string formatLine(std::string title, const std::string& text) {
    title = toPrintable(title);
    const size_t columns = std::max(kTitleColumns, countColumns(title) + 1);
    return "  " + fitColumns(std::move(title), columns) + toPrintable(text) + "\n";
}

void printLines(const fs::path& file, const std::string& lines) {
    std::printf("%s\n%s", toPrintable(file.native()).c_str(),
                lines.empty() ? tr("host.Tag.empty", "  (empty)\n").c_str() : lines.c_str());
}

void show(CLibrary& library, const fs::path& file, bool json) {
    const TagTexts texts = readTagTexts(library, file);
    if (json) {
        nlohmann::json line{{"file", file.native()}};
        for (const STagField& field : getTagFields()) line[field.key] = texts.at(field.name);
        std::printf("%s\n", toLine(line).c_str());
        return;
    }
    std::string lines;
    for (const STagField& field : getTagFields())
        if (const std::string& text = texts.at(field.name); !text.empty())
            lines += formatLine(getTitle(field), text);
    printLines(file, lines);
}

void showAll(const fs::path& file, bool json) {
    const SWholeTag tag = readWholeTag(file);
    if (json) {
        nlohmann::json line{{"file", file.native()},
                            {"fields", nlohmann::json::object()},
                            {"pictures", nlohmann::json::array()},
                            {"others", tag.others}};
        for (const auto& [name, values] : tag.fields) line["fields"][name] = values;
        for (const STagPicture& picture : tag.pictures) line["pictures"].push_back(toJson(picture));
        std::printf("%s\n", toLine(line).c_str());
        return;
    }
    std::string lines;
    for (const auto& [name, values] : tag.fields)
        for (const std::string& value : values) lines += formatLine(name, value);
    for (const STagPicture& picture : tag.pictures)
        lines += formatLine(tr("host.Tag.picture", "(picture)"), describe(picture));
    for (const std::string& name : tag.others) lines += formatLine(tr("host.Tag.other", "(other)"), name);
    printLines(file, lines);
}

// Whether the exports cannot make this change to a WAV file.
bool needsWholeTag(CLibrary& library, const fs::path& file, const STagFields& fields) {
    if (codecName(file) != "WAV") return false;
    const TagTexts texts = readTagTexts(library, file);
    for (const char* name : {"album", "album-artist"})
        if (const auto wanted = fields.usual.find(name);
            wanted != fields.usual.end() && texts.at(name) != toUTF8(wanted->second.c_str()))
            return true;
    return false;
}

// Through the functions for whole tags, which can hold what the exports cannot.
bool changeWholeTag(CLibrary& library, const fs::path& file, const STagFields& fields) {
    CTagChange change;
    const TagTexts texts = readTagTexts(library, file);
    for (const auto& [name, text] : fields.usual)
        if (const std::string wanted = toUTF8(text.c_str()); texts.at(name) != wanted)
            setTagText(change, file, name, wanted);
    for (const auto& [name, value] : fields.others) change.setField(name, value);
    return change.apply(file);
}

void copy(const fs::path& from, const fs::path& to, bool json) {
    checkTagged(to);
    if (isSameFile(from, to)) throw std::runtime_error(tr("host.Tag.copySource", "Is the file to copy from"));
    clearFailure();
    char* names = nullptr;
    const int32_t copied = TONEWRIGHT_Host_CopyTags(toURI(from).c_str(), toURI(to).c_str(), &names);
    const std::string lost = names ? names : "";
    TONEWRIGHT_Host_Free(names);
    if (copied != 1)
        throw std::runtime_error(
            copied == 0 ? tr("host.Tag.unreadableSource", "The tag of %FILE% cannot be read: %REASON%",
                             {{"%FILE%", from.native()},
                              {"%REASON%", takeFailure(tr("host.unknown", "unknown"), from)}})
                        : takeFailure(tr("host.Tag.unwritable", "The tag could not be written"), to));
    if (json)
        std::printf("%s\n", toLine({{"file", to.native()}, {"lost", lost}}).c_str());
    else
        std::printf("%s\n",
                    tr("host.Tag.copied", "%FILE%: copied", {{"%FILE%", toPrintable(to.native())}}).c_str());
    if (!json && !lost.empty())
        printFailure(to, tr("host.Tag.lost", "Warning: cannot hold these fields of the tag: %LIST%",
                            {{"%LIST%", lost}}));
}

} // namespace

std::string describe(const STagPicture& picture) {
    std::string text = getPictureTypeName(picture.type) + ", " + picture.mimeType + ", ";
    if (picture.width > 0)
        text += std::to_string(picture.width) + "x" + std::to_string(picture.height) + ", ";
    text += formatSize(picture.data.size());
    return picture.description.empty() ? text : text + ", " + picture.description;
}

nlohmann::json toJson(const STagPicture& picture) {
    return {{"type", getPictureTypeName(picture.type)},
            {"mime_type", picture.mimeType},
            {"bytes", picture.data.size()},
            {"width", picture.width},
            {"height", picture.height},
            {"description", picture.description}};
}

bool changeTag(CLibrary& library, const fs::path& file, const STagFields& fields) {
    checkTagged(file);
    CFileTag tag(library, file);
    if (!tag || !fields.others.empty() || needsWholeTag(library, file, fields))
        return changeWholeTag(library, file, fields);
    bool changed = false;
    for (const STagField& field : getTagFields()) {
        const auto wanted = fields.usual.find(field.name);
        if (wanted == fields.usual.end() || tag.get(field) == wanted->second) continue;
        tag.set(field, wanted->second);
        changed = true;
    }
    if (changed) tag.store();
    return changed;
}

void printChanged(const fs::path& file, bool changed, bool json) {
    if (json)
        std::printf("%s\n", toLine({{"file", file.native()}, {"changed", changed}}).c_str());
    else
        std::printf("%s\n", (changed ? tr("host.Tag.changed", "%FILE%: changed",
                                          {{"%FILE%", toPrintable(file.native())}})
                                     : tr("host.Tag.unchanged", "%FILE%: unchanged",
                                          {{"%FILE%", toPrintable(file.native())}}))
                                .c_str());
}

int showTags(CLibrary& library, const SShowTagOptions& options) {
    return forEachFile(options.files, options.json, EReader::needed, [&](const fs::path& file) {
        if (options.all)
            showAll(file, options.json);
        else
            show(library, file, options.json);
    });
}

int setTags(CLibrary& library, const SSetTagOptions& options) {
    return forEachFile(options.files, options.json, EReader::optional, [&](const fs::path& file) {
        printChanged(file, changeTag(library, file, options.fields), options.json);
    });
}

int copyTags(const SCopyTagOptions& options) {
    return forEachFile(options.to, options.json, EReader::optional,
                       [&](const fs::path& file) { copy(options.from, file, options.json); });
}

} // namespace host

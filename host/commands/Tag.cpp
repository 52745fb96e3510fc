#include "commands/Tag.h"
#include "base/Text.h"
#include "commands/ForEachFile.h"
#include "media/FileTag.h"
#include "media/SoundFile.h"
#include "terminal/Progress.h"

#include <cstdio>
#include <stdexcept>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr size_t kTitleColumns = 14;

CFileTag openTag(CLibrary& library, const fs::path& file) {
    checkInput(file);
    CFileTag tag(library, file);
    if (!tag)
        throw std::runtime_error("No tag is known for " +
                                 (isWideWav(file) ? std::string("RF64 files") : describeKind(file)));
    return tag;
}

void show(CLibrary& library, const fs::path& file, bool json) {
    const CFileTag tag = openTag(library, file);
    if (json) {
        nlohmann::json line{{"file", file.native()}};
        for (const STagField& field : getTagFields()) line[field.key] = toUTF8(tag.get(field).c_str());
        std::printf("%s\n", toLine(line).c_str());
        return;
    }
    std::string lines;
    for (const STagField& field : getTagFields()) {
        const std::string text = toPrintable(toUTF8(tag.get(field).c_str()));
        if (text.empty()) continue;
        std::string title = field.title;
        title.resize(kTitleColumns, ' ');
        lines += "  " + title + text + "\n";
    }
    std::printf("%s\n%s", toPrintable(file.native()).c_str(), lines.empty() ? "  (empty)\n" : lines.c_str());
}

// Returns whether the file was written; a file that already has these values is not.
bool change(CLibrary& library, const fs::path& file, const SSetTagOptions& options) {
    CFileTag tag = openTag(library, file);
    bool changed = false;
    for (const STagField& field : getTagFields()) {
        const auto wanted = options.fields.find(field.name);
        if (wanted == options.fields.end() || tag.get(field) == wanted->second) continue;
        tag.set(field, wanted->second);
        // If one field cannot be set, none is written.
        if (tag.get(field).empty() && !wanted->second.empty())
            throw std::runtime_error("No " + std::string(field.title) + " can be stored in " +
                                     describeKind(file));
        changed = true;
    }
    if (changed) tag.store();
    return changed;
}

} // namespace

int showTags(CLibrary& library, const std::vector<fs::path>& files, bool json) {
    return forEachFile(files, json, EReader::needed,
                       [&](const fs::path& file) { show(library, file, json); });
}

int setTags(CLibrary& library, const SSetTagOptions& options) {
    return forEachFile(options.files, options.json, EReader::optional, [&](const fs::path& file) {
        const bool changed = change(library, file, options);
        if (options.json)
            std::printf("%s\n", toLine({{"file", file.native()}, {"changed", changed}}).c_str());
        else
            std::printf("%s: %s\n", toPrintable(file.native()).c_str(), changed ? "changed" : "unchanged");
    });
}

} // namespace host

#include "commands/TagNames.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "commands/ForEachFile.h"
#include "commands/Tag.h"
#include "media/FileTag.h"
#include "media/WholeTag.h"
#include "terminal/Progress.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <set>
#include <stdexcept>
#include <unistd.h>

namespace host {

namespace fs = std::filesystem;

namespace {

const char* getKey(const std::string& name) {
    for (const STagField& field : getTagFields())
        if (field.name == name) return field.key;
    return "";
}

void setFromName(CLibrary& library, const fs::path& file, const STagNameOptions& options) {
    checkTagged(file);
    const auto found = options.pattern->match(fs::absolute(file));
    if (!found) throw std::runtime_error(tr("host.Names.noMatch", "The name does not match the pattern"));
    STagFields fields;
    for (const auto& [name, text] : *found) {
        const std::optional<std::u16string> wide = toUTF16(text);
        if (!wide) throw std::runtime_error(tr("host.Names.notUTF8", "The name is not UTF-8"));
        fields.usual[name] = *wide;
    }
    if (!options.dryRun) return printChanged(file, changeTag(library, file, fields), options.json);
    nlohmann::json line{{"file", file.native()}};
    std::string text;
    for (const auto& [name, value] : *found) {
        line[getKey(name)] = value;
        text += "  " + fitColumns(name, 14) + toPrintable(value) + "\n";
    }
    if (options.json)
        std::printf("%s\n", toLine(line).c_str());
    else
        std::printf("%s\n%s", toPrintable(file.native()).c_str(), text.c_str());
}

[[noreturn]] void failToMove(const fs::path& target, int error) {
    if (error == EEXIST)
        throw std::runtime_error(tr("host.exists", "%FILE% exists", {{"%FILE%", target.native()}}));
    if (error == EXDEV)
        throw std::runtime_error(tr("host.Names.otherFileSystem", "%FILE% is on another file system",
                                    {{"%FILE%", target.native()}}));
    throw std::runtime_error(tr("host.unwritableReason", "%FILE% cannot be written: %REASON%",
                                {{"%FILE%", target.native()}, {"%REASON%", std::strerror(error)}}));
}

// Removes the folders that it made unless the move succeeds.
class CFolders {
public:
    explicit CFolders(const fs::path& folder) {
        std::vector<fs::path> missing;
        std::error_code none;
        for (fs::path each = folder; !each.empty() && !fs::exists(each, none); each = each.parent_path())
            missing.push_back(each);
        for (auto each = missing.rbegin(); each != missing.rend(); ++each) {
            std::error_code error;
            if (fs::create_directory(*each, error)) m_made.push_back(*each);
            if (!error) continue;
            remove();
            throw std::runtime_error(tr("host.folderNotCreated",
                                        "The folder %FOLDER% cannot be created: %REASON%",
                                        {{"%FOLDER%", each->native()}, {"%REASON%", error.message()}}));
        }
    }
    ~CFolders() { remove(); }
    CFolders(const CFolders&) = delete;
    CFolders& operator=(const CFolders&) = delete;

    void keep() { m_made.clear(); }

private:
    void remove() {
        std::error_code none;
        for (; !m_made.empty(); m_made.pop_back()) fs::remove(m_made.back(), none);
    }

    std::vector<fs::path> m_made;
};

// Never replaces a file, whatever other programs do meanwhile.
void move(const fs::path& file, const fs::path& target) {
    CFolders folders(target.parent_path());
    if (::renameat2(AT_FDCWD, file.c_str(), AT_FDCWD, target.c_str(), RENAME_NOREPLACE) != 0) {
        if (errno != EINVAL && errno != ENOSYS) failToMove(target, errno);
        // The file system cannot do that in one step.
        if (::link(file.c_str(), target.c_str()) != 0) failToMove(target, errno);
        ::unlink(file.c_str());
    }
    folders.keep();
}

} // namespace

int setTagsFromNames(CLibrary& library, const STagNameOptions& options) {
    return forEachFile(options.files, options.json, EReader::optional,
                       [&](const fs::path& file) { setFromName(library, file, options); });
}

int renameByTags(CLibrary& library, const STagNameOptions& options) {
    std::set<fs::path> planned;
    return forEachFile(options.files, options.json, EReader::optional, [&](const fs::path& file) {
        TagTexts texts = readTagTexts(library, file);
        texts["name"] = file.stem().native();
        const fs::path folder = options.directory.empty() ? file.parent_path() : options.directory;
        const fs::path target = folder / options.pattern->expand(texts, file.extension());
        const bool renames = target.lexically_normal() != file.lexically_normal();
        std::error_code none;
        if (!planned.insert(target.lexically_normal()).second ||
            (renames && fs::exists(fs::symlink_status(target, none))))
            failToMove(target, EEXIST);
        if (renames && !options.dryRun) move(file, target);
        if (options.json)
            std::printf("%s\n", toLine({{"file", file.native()},
                                        {"target", target.native()},
                                        {"renamed", renames && !options.dryRun}})
                                    .c_str());
        else if (renames)
            std::printf("%s -> %s\n", toPrintable(file.native()).c_str(),
                        toPrintable(target.native()).c_str());
        else
            std::printf("%s\n", tr("host.Tag.unchanged", "%FILE%: unchanged",
                                   {{"%FILE%", toPrintable(file.native())}})
                                    .c_str());
    });
}

} // namespace host

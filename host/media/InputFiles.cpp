#include "media/InputFiles.h"

#include "base/Text.h"
#include "base/Translation.h"

#include <algorithm>
#include <sys/stat.h>
#include <utility>

namespace host {

namespace fs = std::filesystem;

namespace {

std::string toLower(std::string text) {
    std::transform(text.begin(), text.end(), text.begin(), [](unsigned char c) { return std::tolower(c); });
    return text;
}

class CFolderWalk {
public:
    CFolderWalk(std::vector<SInputFile>& found, const std::set<std::string>& extensions,
                const fs::path& excluded)
        : m_found(found), m_extensions(extensions) {
        enter(excluded);
    }

    void visit(const fs::path& folder, const fs::path& below) {
        if (!enter(folder)) return;
        std::error_code error;
        std::vector<fs::path> entries;
        for (fs::directory_iterator entry(folder, error), end; !error && entry != end; entry.increment(error))
            if (!entry->path().filename().native().starts_with('.')) entries.push_back(entry->path());
        if (error) return m_found.push_back({folder, below, error.message()});
        std::sort(entries.begin(), entries.end());
        for (const fs::path& entry : entries) {
            std::error_code none;
            if (fs::is_directory(entry, none))
                visit(entry, below / entry.filename());
            else if (fs::is_regular_file(entry, none) && hasExtension(entry))
                m_found.push_back({entry, below, ""});
        }
    }

private:
    bool hasExtension(const fs::path& file) const {
        const std::string extension = toLower(file.extension());
        return !extension.empty() && m_extensions.count(extension.substr(1)) > 0;
    }
    // False if the folder has been visited before, under any name.
    bool enter(const fs::path& folder) {
        struct stat status;
        if (folder.empty() || ::stat(folder.c_str(), &status) != 0) return true;
        return m_visited.insert({status.st_dev, status.st_ino}).second;
    }

    std::vector<SInputFile>& m_found;
    const std::set<std::string>& m_extensions;
    std::set<std::pair<dev_t, ino_t>> m_visited;
};

bool isSame(const fs::path& a, const fs::path& b) {
    std::error_code none;
    return fs::equivalent(a, b, none);
}

} // namespace

std::set<std::string> listReadExtensions(CLibrary& library) {
    std::set<std::string> extensions;
    const CHandle list(library.getValidCodecExtensions(TONEWRIGHT_AUDIO_SOURCE));
    for (int32_t i = 0; i < library.getExtensionCount(list.get()); ++i) {
        const CHandle text(library.getExtension(list.get(), i));
        if (text) extensions.insert(toLower(toUTF8(TONEWRIGHT_GetText(text.get()))));
    }
    return extensions;
}

std::vector<SInputFile> listInputs(CLibrary& library, const std::vector<fs::path>& inputs, bool recursive,
                                   const fs::path& excluded) {
    const std::set<std::string> extensions =
        recursive ? listReadExtensions(library) : std::set<std::string>();
    std::vector<SInputFile> found;
    for (const fs::path& input : inputs) {
        std::error_code none;
        if (!fs::is_directory(input, none)) {
            found.push_back({input, "", ""});
        } else if (!recursive) {
            found.push_back(
                {input, "",
                 tr("host.Convert.directory", "Is a directory; --recursive converts the files in it")});
        } else {
            const size_t before = found.size();
            CFolderWalk(found, extensions, isSame(input, excluded) ? fs::path() : excluded).visit(input, "");
            if (found.size() == before)
                found.push_back(
                    {input, "", tr("host.Convert.emptyFolder", "The folder has no files that can be read")});
        }
    }
    return found;
}

} // namespace host

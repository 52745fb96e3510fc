#include "media/DiscFiles.h"

#include "base/Text.h"
#include "base/Translation.h"
#include "media/SoundFile.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <stdexcept>
#include <sys/stat.h>
#include <unistd.h>

namespace host {

namespace fs = std::filesystem;

namespace {

[[noreturn]] void fail(const fs::path& file, const std::string& reason) {
    throw std::runtime_error(toPrintable(file.native()) + ": " + reason);
}

// Of the folder "." as well.
std::string getName(const fs::path& input) {
    std::error_code none;
    const fs::path plain = fs::absolute(input).lexically_normal();
    fs::path name = plain.has_filename() ? plain.filename() : plain.parent_path().filename();
    if (name == ".." || name == ".") name = fs::canonical(input, none).filename();
    return name.native();
}

class CWalk {
public:
    CWalk(std::vector<SDiscFile>& found, const fs::path& excluded) : m_found(found), m_excluded(excluded) {}

    void visit(const fs::path& entry, const CDiscProject::Path& path) {
        struct stat status;
        if (::stat(entry.c_str(), &status) != 0) fail(entry, std::strerror(errno));
        if (S_ISDIR(status.st_mode)) return visitFolder(entry, path, {status.st_dev, status.st_ino});
        if (!S_ISREG(status.st_mode)) fail(entry, tr("host.notRegular", "Is not a regular file"));
        if (::access(entry.c_str(), R_OK) != 0) fail(entry, std::strerror(errno));
        if (!isSameFile(entry, m_excluded)) m_found.push_back({path, entry});
    }

private:
    using Id = std::pair<dev_t, ino_t>;

    void visitFolder(const fs::path& folder, const CDiscProject::Path& path, const Id& id) {
        if (std::find(m_parents.begin(), m_parents.end(), id) != m_parents.end())
            fail(folder, tr("host.Burn.loop", "The folder contains itself through a symbolic link"));
        std::error_code error;
        std::vector<fs::path> entries;
        for (fs::directory_iterator entry(folder, error), end; !error && entry != end; entry.increment(error))
            entries.push_back(entry->path());
        if (error) fail(folder, error.message());
        std::sort(entries.begin(), entries.end());
        if (!path.empty()) m_found.push_back({path, ""});
        m_parents.push_back(id);
        for (const fs::path& entry : entries) {
            CDiscProject::Path inner = path;
            inner.push_back(entry.filename().native());
            visit(entry, inner);
        }
        m_parents.pop_back();
    }

    std::vector<SDiscFile>& m_found;
    const fs::path& m_excluded;
    std::vector<Id> m_parents; // of the folder that is being visited
};

} // namespace

std::vector<SDiscFile> listDiscFiles(const std::vector<fs::path>& inputs, const fs::path& excluded) {
    std::vector<SDiscFile> found;
    CWalk walk(found, excluded);
    for (const fs::path& input : inputs) {
        const std::string name = getName(input);
        walk.visit(input, name.empty() ? CDiscProject::Path() : CDiscProject::Path{name});
    }
    return found;
}

} // namespace host

#include "commands/ExtractFiles.h"

#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "media/Disc.h"
#include "media/EncodeJob.h"
#include "media/Output.h"
#include "terminal/Progress.h"

#include <algorithm>
#include <cerrno>
#include <ctime>
#include <fcntl.h>
#include <fstream>
#include <optional>
#include <stdexcept>
#include <sys/stat.h>
#include <system_error>
#include <vector>

namespace host {

namespace fs = std::filesystem;

namespace {

using Cursor = DiscHandle<DISCIO_DataCursor>;

constexpr int64_t kPortion = 1 << 20; // bytes read at once

class CExtractor {
public:
    CExtractor(CLibrary& library, const SExtractOptions& options)
        : m_options(options), m_disc(options.place),
          m_progress(options.json ? EOutput::json : EOutput::normal),
          m_temporaryEnding(setTemporaryEnding(library)) {}

    int run();

private:
    Cursor openFolder(const std::string& path) const;
    void extractNamed(const std::string& name);
    void extractAll(const Cursor& cursor, const fs::path& folder);
    void extractEntry(const Cursor& cursor, const fs::path& folder);
    void copyFile(const Cursor& cursor, const fs::path& target, CProgress::Job job);

    const SExtractOptions& m_options;
    CDisc m_disc;
    CProgress m_progress;
    std::string m_temporaryEnding;
    bool m_hasFailed = false;
};

// Names on a disc are whatever its author wrote.
fs::path toFileName(const Cursor& cursor) {
    const std::string name = toUTF8(getDiscFunctions().DataCursorGetNameW(cursor.get()));
    if (name.empty() || name == "." || name == ".." || name.find('/') != std::string::npos)
        throw std::runtime_error(tr("host.Extract.badName", "The name cannot be that of a file"));
    return name;
}

std::string toDiscPath(const Cursor& cursor) {
    std::string path = toUTF8(getDiscFunctions().DataCursorGetDiscPathW(cursor.get()));
    replaceAll(path, "\\", "/");
    return path;
}

Cursor CExtractor::openFolder(const std::string& path) const {
    const auto wide = toUTF16(path);
    if (!wide) throw std::runtime_error(tr("host.Extract.notFound", "There is no such file on the disc"));
    Cursor cursor(getDiscFunctions().DiscDataCreateCursorW(m_disc.getHandle(), wide->c_str()));
    if (!cursor) throw makeDiscError();
    return cursor;
}

void CExtractor::extractNamed(const std::string& name) {
    std::string path = name;
    while (!path.empty() && path.back() == '/') path.pop_back();
    if (path.empty()) return extractAll(openFolder(""), m_options.directory);
    const size_t slash = path.rfind('/');
    const Cursor cursor = openFolder(slash == std::string::npos ? "" : path.substr(0, slash));
    const std::string last = path.substr(slash + 1);
    while (getDiscFunctions().DataCursorNext(cursor.get()) == 1)
        if (toUTF8(getDiscFunctions().DataCursorGetNameW(cursor.get())) == last)
            return extractEntry(cursor, m_options.directory);
    throw std::runtime_error(tr("host.Extract.notFound", "There is no such file on the disc"));
}

void CExtractor::extractAll(const Cursor& cursor, const fs::path& folder) {
    createFolders(folder);
    while (!isCancelled() && getDiscFunctions().DataCursorNext(cursor.get()) == 1)
        extractEntry(cursor, folder);
}

// A failure is reported, and the next entry is tried.
void CExtractor::extractEntry(const Cursor& cursor, const fs::path& folder) {
    const SDiscFunctions& functions = getDiscFunctions();
    std::optional<CProgress::Job> job;
    try {
        if (functions.DataCursorIsFolder(cursor.get()) == 1) {
            const Cursor inner(functions.DataCursorCreateSubCursor(cursor.get()));
            if (!inner) throw makeDiscError();
            return extractAll(inner, folder / toFileName(cursor));
        }
        const fs::path target = folder / toFileName(cursor);
        job = m_progress.start(toDiscPath(cursor), target, nlohmann::json::object());
        copyFile(cursor, target, *job);
    } catch (const std::exception& failure) {
        m_hasFailed = true;
        if (!job) job = m_progress.start(toDiscPath(cursor), folder, nlohmann::json::object());
        m_progress.fail(*job, failure.what());
    }
}

void CExtractor::copyFile(const Cursor& cursor, const fs::path& target, CProgress::Job job) {
    const SDiscFunctions& functions = getDiscFunctions();
    createFolders(target.parent_path());
    COutput place(target, m_temporaryEnding, m_options.force);
    const int64_t size = functions.DataCursorGetSize(cursor.get());
    {
        std::ofstream out(place.getTemporary(), std::ios::binary);
        std::vector<char> portion(kPortion);
        for (int64_t done = 0; done < size;) {
            if (isCancelled()) return m_progress.cancel(job);
            const int64_t count = functions.DataCursorRead(cursor.get(), done, portion.data(), kPortion);
            if (count <= 0) throw makeDiscError();
            if (!out.write(portion.data(), count)) break;
            done += count;
            m_progress.advance(job, static_cast<double>(done) / static_cast<double>(size));
        }
        errno = out ? 0 : errno;
        out.close();
        if (!out)
            throw std::runtime_error(
                tr("host.Extract.notWritten", "%FILE% cannot be written: %REASON%",
                   {{"%FILE%", target.string()}, {"%REASON%", std::generic_category().message(errno)}}));
    }
    if (const int64_t modified = functions.DataCursorGetLastModifiedTime(cursor.get()); modified >= 0) {
        const timespec times[] = {{0, UTIME_OMIT}, {static_cast<std::time_t>(modified), 0}};
        ::utimensat(AT_FDCWD, place.getTemporary().c_str(), times, 0);
    }
    place.commit();
    const auto bytes = static_cast<uint64_t>(size);
    m_progress.finish(job, toPrintable(target.native()) + ": " + formatSize(bytes), {{"bytes", bytes}});
}

int CExtractor::run() {
    for (const std::string& name : m_options.names) {
        if (isCancelled()) break;
        try {
            extractNamed(name);
        } catch (const std::exception& failure) {
            m_hasFailed = true;
            m_progress.fail(m_progress.start(name, m_options.directory, nlohmann::json::object()),
                            failure.what());
        }
    }
    return isCancelled() ? kExitCancelled : m_hasFailed ? kExitFailure : kExitSuccess;
}

} // namespace

int extractFiles(CLibrary& library, const SExtractOptions& options) {
    return CExtractor(library, options).run();
}

} // namespace host

#include "host_support/Output.h"

#include "host_support/Guard.h"
#include "peru/strings/LocalizedFormat.h"

#include <cerrno>
#include <chrono>
#include <climits>
#include <cstdio>
#include <fcntl.h>
#include <filesystem>
#include <mutex>
#include <set>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

namespace tonewright::host_support {

namespace fs = std::filesystem;

namespace {

// Temporary files in use by this process, by path; excludes its other jobs whether the file is locked or not.
std::mutex g_mutex;
std::set<std::string> g_claimed;
std::set<std::string> g_swept; // folders

constexpr auto kLeftoverAge = std::chrono::minutes(1);

// Removes the files that killed processes have left in a folder: empty, unlocked files with this suffix and
// any number.
void sweep(const fs::path& folder, std::string suffix) {
    const size_t digits = suffix.find_last_not_of("0123456789") + 1;
    // Without a process number, or with nothing else, the suffix does not identify such files.
    if (digits == suffix.size() || digits == 0) return;
    suffix.resize(digits);
    std::error_code error;
    for (fs::directory_iterator entries(folder, error), end; !error && entries != end;
         entries.increment(error)) {
        const fs::path& path = entries->path();
        const std::string name = path.filename();
        const size_t number = name.find_last_not_of("0123456789") + 1;
        if (number == name.size() || !name.substr(0, number).ends_with(suffix)) continue;
        const int file = ::open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC);
        struct stat status;
        if (file >= 0 && ::fstat(file, &status) == 0 && S_ISREG(status.st_mode) && status.st_size == 0 &&
            std::chrono::system_clock::from_time_t(status.st_mtime) <
                std::chrono::system_clock::now() - kLeftoverAge &&
            ::flock(file, LOCK_EX | LOCK_NB) == 0)
            ::unlink(path.c_str());
        if (file >= 0) ::close(file);
    }
}

// The texts' field is a path.
[[noreturn]] void fail(const peru::SLocalizedText& text, const std::string& path) {
    throw peru::CError(peru::format(text, peru::CString::fromUTF8(path)));
}

// The texts' fields are a path and the system's reason.
[[noreturn]] void failSystem(const peru::SLocalizedText& text, const std::string& path, int error) {
    throw peru::CError(
        peru::format(text, peru::CString::fromUTF8(path), peru::CString::fromUTF8(std::strerror(error))));
}

constexpr peru::SLocalizedText kUnwritable{"tonewright.Output.unwritable", "%s cannot be written: %s"};
constexpr peru::SLocalizedText kIrreplaceable{"tonewright.Output.irreplaceable", "%s cannot be replaced: %s"};
constexpr peru::SLocalizedText kNotCreated{"tonewright.Output.notCreated", "%s cannot be created: %s"};
constexpr peru::SLocalizedText kCreatedMeanwhile{"tonewright.Output.createdMeanwhile",
                                                 "%s was created in the meantime"};

} // namespace

COutput::COutput(const std::string& path, const std::string& suffix, int32_t flags) : m_flags(flags) {
    findTarget(path);
    nameTemporary(suffix);
    const std::string folder = fs::path(m_target).parent_path();
    if (std::unique_lock lock(g_mutex); g_swept.insert(folder).second) {
        lock.unlock();
        sweep(folder, suffix);
    }
    claim();
    try {
        create();
    } catch (...) {
        std::lock_guard lock(g_mutex);
        g_claimed.erase(m_temporary);
        throw;
    }
}

COutput::~COutput() {
    if (!m_isOver) ::unlink(m_temporary.c_str());
    if (m_lock >= 0) ::close(m_lock);
    std::lock_guard lock(g_mutex);
    g_claimed.erase(m_temporary);
}

void COutput::findTarget(const std::string& path) {
    std::error_code error;
    fs::path target = fs::absolute(path, error);
    // A dangling link stands for the file to which it points.
    for (int links = 0; links < 40 && fs::is_symlink(target, error); ++links) {
        const fs::path meant = fs::read_symlink(target, error);
        if (error) failSystem(kUnwritable, path, error.value());
        target = meant.is_absolute() ? meant : target.parent_path() / meant;
    }
    const std::string shownFolder =
        fs::path(path).has_parent_path() ? fs::path(path).parent_path() : target.parent_path();
    // Different names of one folder must result in the same temporary file.
    const fs::path folder = fs::canonical(target.parent_path(), error);
    if (error == std::errc::no_such_file_or_directory)
        fail({"tonewright.Output.noFolder", "The folder %s does not exist"}, shownFolder);
    if (error)
        failSystem({"tonewright.Output.unusableFolder", "The folder %s cannot be used: %s"}, shownFolder,
                   error.value());
    if (!fs::is_directory(folder, error))
        fail({"tonewright.Output.notAFolder", "%s is not a folder"}, shownFolder);
    m_target = folder / target.filename();

    struct stat status;
    if (::stat(m_target.c_str(), &status) == 0) {
        if (S_ISDIR(status.st_mode)) failSystem(kUnwritable, path, EISDIR);
        if (!S_ISREG(status.st_mode))
            fail({"tonewright.Output.notRegular", "%s cannot be written: It is not a regular file"}, path);
        if (!(m_flags & TONEWRIGHT_OUTPUT_REPLACE)) fail({"tonewright.Output.exists", "%s exists"}, path);
    } else if (errno != ENOENT) {
        failSystem(kUnwritable, path, errno);
    }
    if (::access(folder.c_str(), W_OK | X_OK) != 0)
        failSystem({"tonewright.Output.readOnlyFolder", "The folder %s cannot be written to: %s"},
                   shownFolder, errno);
}

// A name too long for the suffix is shortened before its extension, which selects the format.
void COutput::nameTemporary(const std::string& suffix) {
    const fs::path target = m_target;
    std::string name = target.filename();
    if (name.size() + suffix.size() > NAME_MAX) {
        const std::string extension = target.extension();
        size_t hash = std::hash<std::string>()(name);
        const std::string end = "~" + std::to_string(hash % 1000000) + extension;
        if (end.size() + suffix.size() >= NAME_MAX)
            fail({"tonewright.Output.longName", "%s cannot be written: The name is too long"}, m_target);
        size_t length = NAME_MAX - end.size() - suffix.size();
        while (length > 0 && (name[length] & 0xC0) == 0x80) --length;
        name = name.substr(0, length) + end;
    }
    m_temporary = target.parent_path() / (name + suffix);
}

// Excludes other jobs of this process. Other processes are excluded by a lock on the temporary file, which
// ends with the process that holds it; an encoder locks the file that it creates.
void COutput::claim() {
    std::lock_guard lock(g_mutex);
    if (!g_claimed.insert(m_temporary).second)
        fail({"tonewright.Output.otherJob", "Another job is already writing to %s"}, m_target);
}

// Removes the temporary file of a process that has ended.
void COutput::removeLeftover() const {
    const int left = ::open(m_temporary.c_str(), O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC);
    if (left < 0) failSystem(kIrreplaceable, m_temporary, errno);
    struct stat status;
    const bool isFile = ::fstat(left, &status) == 0 && S_ISREG(status.st_mode);
    const bool isFree = isFile && ::flock(left, LOCK_EX | LOCK_NB) == 0;
    if (isFree) ::unlink(m_temporary.c_str());
    ::close(left);
    if (!isFile)
        fail({"tonewright.Output.irregularLeftover", "%s cannot be replaced: It is not a regular file"},
             m_temporary);
    if (!isFree)
        fail({"tonewright.Output.otherProgram", "Another program is already writing to %s"}, m_target);
}

void COutput::create() {
    struct stat status;
    const bool isLeft = ::lstat(m_temporary.c_str(), &status) == 0;
    if (isLeft && !(m_flags & TONEWRIGHT_OUTPUT_REPLACE))
        fail({"tonewright.Output.leftover", "%s was left by an earlier run"}, m_temporary);
    if (isLeft) removeLeftover();
    if (m_flags & TONEWRIGHT_OUTPUT_LIVE) return; // the encoder creates it
    // A file that replaces a private one must be private from the beginning; commit sets the final mode.
    const bool replaces = ::stat(m_target.c_str(), &status) == 0;
    m_lock = ::open(m_temporary.c_str(), O_RDWR | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC,
                    replaces ? S_IRUSR | S_IWUSR : 0666);
    if (m_lock < 0) failSystem(kNotCreated, m_target, errno);
    ::flock(m_lock, LOCK_EX | LOCK_NB);
}

void COutput::commit() {
    const int file = ::open(m_temporary.c_str(), O_RDONLY | O_NOFOLLOW | O_CLOEXEC);
    if (file < 0)
        failSystem({"tonewright.Output.notCompleted", "%s cannot be completed: %s"}, m_target, errno);
    struct stat status;
    if ((m_flags & TONEWRIGHT_OUTPUT_REPLACE) && ::stat(m_target.c_str(), &status) == 0) {
        // Best effort: the target may belong to another user.
        if (::fchown(file, status.st_uid, status.st_gid) != 0) errno = 0;
        ::fchmod(file, status.st_mode & 07777);
    }
    const int synced = ::fsync(file) == 0 ? 0 : errno;
    ::close(file);
    if (synced != 0)
        failSystem({"tonewright.Output.notSynced", "%s cannot be written to the disk: %s"}, m_target, synced);

    if (m_flags & TONEWRIGHT_OUTPUT_REPLACE) {
        if (::rename(m_temporary.c_str(), m_target.c_str()) != 0) failSystem(kIrreplaceable, m_target, errno);
    } else if (::renameat2(AT_FDCWD, m_temporary.c_str(), AT_FDCWD, m_target.c_str(), RENAME_NOREPLACE) !=
               0) {
        // A file created in the meantime is not replaced, even if the file system does not support the flag.
        if (errno == EEXIST) fail(kCreatedMeanwhile, m_target);
        if (::link(m_temporary.c_str(), m_target.c_str()) == 0)
            ::unlink(m_temporary.c_str());
        else if (errno == EEXIST)
            fail(kCreatedMeanwhile, m_target);
        else if (::access(m_target.c_str(), F_OK) == 0 ||
                 ::rename(m_temporary.c_str(), m_target.c_str()) != 0)
            failSystem(kNotCreated, m_target, errno);
    }
    m_isOver = true;
    const int folder = ::open(fs::path(m_target).parent_path().c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (folder >= 0) {
        ::fsync(folder); // makes the new name durable; not supported by all file systems
        ::close(folder);
    }
}

} // namespace tonewright::host_support

using namespace tonewright::host_support;

TONEWRIGHT_Handle TONEWRIGHT_Host_CreateOutput(const char* path, const char* suffix, int32_t flags) {
    return guard<TONEWRIGHT_Handle>(nullptr, [&] {
        if (!path || !*path || !suffix || !*suffix)
            throw peru::CError(
                peru::localize("tonewright.Output.noPath", "An output needs a path and a suffix"));
        return wrap(peru::make<COutput>(path, suffix, flags));
    });
}

const char* TONEWRIGHT_Host_GetOutputPath(TONEWRIGHT_Handle output) {
    const P<COutput> object = unwrap<COutput>(output);
    return object ? object->getTemporary().c_str() : nullptr;
}

int32_t TONEWRIGHT_Host_CommitOutput(TONEWRIGHT_Handle output) {
    return guard(0, [&] {
        require<COutput>(output, "an output")->commit();
        return 1;
    });
}

void TONEWRIGHT_Host_KeepOutput(TONEWRIGHT_Handle output) {
    if (const P<COutput> object = unwrap<COutput>(output)) object->keep();
}

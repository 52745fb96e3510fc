#include "filetag/posix/OpenedFile.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <fcntl.h>
#include <sys/file.h>
#include <system_error>
#include <thread>
#include <unistd.h>

namespace filetag::posix {

using namespace peru;

namespace {

constexpr int64_t kPage = 4096;

std::string getPath(const P<IURI>& file) {
    const std::string path = CString::toStdString(getPathes()->toPlatformPath(file));
    if (path.empty()) throw CURITypeNotSupportedError(file);
    return path;
}

bool isSameTime(const timespec& one, const timespec& other) {
    return one.tv_sec == other.tv_sec && one.tv_nsec == other.tv_nsec;
}

// Whether the file may have been written to, whatever its modification time says, which programs can restore.
// A new link, mode or owner explains a later time of change.
bool isTouched(const struct stat& one, const struct stat& other) {
    if (!isSameTime(one.st_mtim, other.st_mtim)) return true;
    return !isSameTime(one.st_ctim, other.st_ctim) && one.st_nlink == other.st_nlink &&
           one.st_mode == other.st_mode && one.st_uid == other.st_uid && one.st_gid == other.st_gid;
}

} // namespace

CDescriptor::~CDescriptor() {
    if (m_descriptor >= 0) ::close(m_descriptor);
}

COpenedFile::COpenedFile(const P<IURI>& uri)
    : m_uri(uri), m_path(getPath(uri)), m_file(openPath()), m_state(readState(m_file.get())) {}

void COpenedFile::fail(int error) const {
    if (error == EACCES || error == EPERM) throw CFileAccessDeniedError(m_uri);
    if (error == ENOENT || error == ENOTDIR) throw CFileNotFoundError(m_uri);
    throw CFileError(localize("filetag.COpenedFile.ReadError", "The file '%FILE%' could not be read (%MSG%).",
                              {{"%FILE%", getShownName(m_uri)},
                               {"%MSG%", CString::fromUTF8(std::generic_category().message(error))}}),
                     m_uri);
}

int COpenedFile::openPath() const {
    const int descriptor = ::open(m_path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC);
    if (descriptor < 0) fail(errno);
    return descriptor;
}

COpenedFile::SState COpenedFile::readState(int descriptor) const {
    SState state;
    if (::fstat(descriptor, &state.status) != 0) fail(errno);
    if (!S_ISREG(state.status.st_mode))
        throw CFileError(localize("filetag.COpenedFile.NotRegular", "'%FILE%' is not a regular file.",
                                  {{"%FILE%", getShownName(m_uri)}}),
                         m_uri);
    const int64_t size = state.status.st_size;
    const auto read = [&](int64_t start, int64_t end) {
        const size_t old = state.pages.size();
        state.pages.resize(old + static_cast<size_t>(end - start));
        const ssize_t count = ::pread(descriptor, &state.pages[old], static_cast<size_t>(end - start), start);
        if (count < 0) fail(errno);
        state.pages.resize(old + static_cast<size_t>(count));
    };
    const int64_t head = std::min(size, kPage);
    read(0, head);
    read(std::max(head, size - kPage), size);
    return state;
}

int COpenedFile::duplicate() const {
    const int descriptor = ::fcntl(m_file.get(), F_DUPFD_CLOEXEC, 0);
    if (descriptor < 0) fail(errno);
    return descriptor;
}

void COpenedFile::checkUnchanged() const {
    const CDescriptor file(openPath());
    const SState now = readState(file.get());
    const struct stat& old = m_state.status;
    if (now.status.st_dev == old.st_dev && now.status.st_ino == old.st_ino &&
        now.status.st_size == old.st_size && !isTouched(now.status, old) && now.pages == m_state.pages)
        return;
    failChanged();
}

void COpenedFile::failChanged() const {
    throw CFileError(localize("filetag.CTagLibIOStream.FileChanged",
                              "The file '%FILE%' was changed by another program.",
                              {{"%FILE%", getShownName(m_uri)}}),
                     m_uri);
}

COpenedFile::CLock::CLock(const COpenedFile& file) : m_descriptor(file.m_file.get()) {
    using namespace std::chrono;
    const auto end = steady_clock::now() + seconds(10);
    // Where the file system has no locks, checkUnchanged() still narrows the gap to the time of the store.
    while (::flock(m_descriptor, LOCK_EX | LOCK_NB) != 0 && errno == EWOULDBLOCK) {
        if (steady_clock::now() >= end)
            throw CFileError(localize("filetag.COpenedFile.InUse",
                                      "The file '%FILE%' is in use by another program.",
                                      {{"%FILE%", getShownName(file.m_uri)}}),
                             file.m_uri);
        std::this_thread::sleep_for(milliseconds(5));
    }
}

COpenedFile::CLock::~CLock() {
    ::flock(m_descriptor, LOCK_UN);
}

} // namespace filetag::posix

#include "filetag/posix/OpenedFile.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <ctime>
#include <fcntl.h>
#include <sys/file.h>
#include <system_error>
#include <thread>
#include <unistd.h>

namespace filetag::posix {

using namespace peru;
using std::chrono::steady_clock;

namespace {

constexpr int64_t kPage = 4096;

constexpr std::chrono::seconds kLongestWait(10);

// Where the file system has no locks, checkUnchanged() still narrows the gap to the time of the store.
void lock(int descriptor, steady_clock::time_point end, const P<IURI>& uri) {
    while (::flock(descriptor, LOCK_EX | LOCK_NB) != 0 && errno == EWOULDBLOCK) {
        if (steady_clock::now() >= end)
            throw CFileError(localize("filetag.COpenedFile.InUse",
                                      "The file '%FILE%' is in use by another program.",
                                      {{"%FILE%", getShownName(uri)}}),
                             uri);
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
}

std::string getPath(const P<IURI>& file) {
    const std::string path = CString::toStdString(getPathes()->toPlatformPath(file));
    if (path.empty()) throw CURITypeNotSupportedError(file);
    return path;
}

// The tick of the clock that file systems use; twice the longest one of usual kernels.
constexpr int64_t kTick = 20'000'000;

int64_t toNanoseconds(const timespec& time) {
    return int64_t{time.tv_sec} * 1'000'000'000 + time.tv_nsec;
}

bool isOlderThanATick(const timespec& time) {
    timespec now = {};
    ::clock_gettime(CLOCK_REALTIME, &now);
    return toNanoseconds(now) - toNanoseconds(time) > kTick;
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

PERU_EXCEPTION_IMPL(CFileChangedError)

CFileChangedError::CFileChangedError(const P<IURI>& file)
    : CFileError(localize("filetag.CTagLibIOStream.FileChanged",
                          "The file '%FILE%' was changed by another program.",
                          {{"%FILE%", getShownName(file)}}),
                 file) {}

COpenedFile::COpenedFile(const P<IURI>& uri, EAccess access)
    : m_uri(uri), m_path(getPath(uri)), m_file(access == EAccess::exclusive ? openLocked() : openPath()),
      m_state(readState(m_file.get())),
      m_certain(access == EAccess::exclusive || isOlderThanATick(m_state.status.st_mtim)) {}

void COpenedFile::fail(int error) const {
    if (error == EACCES || error == EPERM) throw CFileAccessDeniedError(m_uri);
    if (error == ENOENT || error == ENOTDIR) throw CFileNotFoundError(m_uri);
    throw CFileError(localize("filetag.COpenedFile.ReadError", "The file '%FILE%' could not be read (%MSG%).",
                              {{"%FILE%", getShownName(m_uri)},
                               {"%MSG%", CString::fromUTF8(std::generic_category().message(error))}}),
                     m_uri);
}

// The file that was locked may have been replaced by the program that held the lock before.
int COpenedFile::openLocked() const {
    const steady_clock::time_point end = steady_clock::now() + kLongestWait;
    for (;;) {
        const CDescriptor file(openPath());
        lock(file.get(), end, m_uri);
        struct stat opened = {}, named = {};
        if (::fstat(file.get(), &opened) != 0) fail(errno);
        if (::stat(m_path.c_str(), &named) != 0) fail(errno);
        if (opened.st_dev != named.st_dev || opened.st_ino != named.st_ino) continue;
        const int descriptor = ::fcntl(file.get(), F_DUPFD_CLOEXEC, 0);
        if (descriptor < 0) fail(errno);
        return descriptor;
    }
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
    throw CFileChangedError(m_uri);
}

COpenedFile::CLock::CLock(const COpenedFile& file) : m_descriptor(file.m_file.get()) {
    lock(m_descriptor, steady_clock::now() + kLongestWait, file.m_uri);
}

COpenedFile::CLock::~CLock() {
    ::flock(m_descriptor, LOCK_UN);
}

} // namespace filetag::posix

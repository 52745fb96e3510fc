#include "ImageLayout.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

namespace discio {

namespace {

[[noreturn]] void fail(int32_t code, const std::string& path, int error) {
    throw CDiscError(code, path + ": " + std::generic_category().message(error));
}

int64_t getChangeTime(const struct stat& status) {
    return int64_t{status.st_mtim.tv_sec} * 1'000'000'000 + status.st_mtim.tv_nsec;
}

} // namespace

CImageFile::CImageFile(const std::string& path) : m_path(path) {
    // A pipe must not block here.
    m_file = ::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK);
    if (m_file < 0) fail(errno == ENOENT ? DISCIO_ERROR_NOT_FOUND : DISCIO_ERROR_READ_INPUT, path, errno);
    struct stat status {};
    const bool isKnown = ::fstat(m_file, &status) == 0;
    if (!isKnown || !S_ISREG(status.st_mode)) {
        ::close(m_file);
        throw CDiscError(DISCIO_ERROR_NOT_A_FILE, path + " is not a regular file");
    }
    m_size = status.st_size;
    m_changed = getChangeTime(status);
}

CImageFile::~CImageFile() {
    ::close(m_file);
}

size_t CImageFile::read(int64_t offset, void* data, size_t size) const {
    size_t done = 0;
    while (done < size) {
        const ssize_t count = ::pread(m_file, static_cast<char*>(data) + done, size - done,
                                      static_cast<off_t>(offset + static_cast<int64_t>(done)));
        if (count < 0 && errno == EINTR) continue;
        if (count < 0) fail(DISCIO_ERROR_READ_INPUT, m_path, errno);
        if (count == 0) break;
        done += static_cast<size_t>(count);
    }
    requireUnchanged();
    return done;
}

void CImageFile::requireUnchanged() const {
    struct stat status {};
    if (::fstat(m_file, &status) != 0 || status.st_size != m_size || getChangeTime(status) != m_changed ||
        status.st_nlink == 0)
        throw CDiscError(DISCIO_ERROR_DISC_LOST, m_path + " has changed since it was opened");
}

std::string CImageFile::readAll(size_t limit) const {
    if (m_size > static_cast<int64_t>(limit))
        throw CDiscError(DISCIO_ERROR_UNSUPPORTED_FORMAT, m_path + " is too large for a sheet");
    std::string bytes(static_cast<size_t>(m_size), '\0');
    bytes.resize(read(0, bytes.data(), bytes.size()));
    return bytes;
}

namespace {

uint32_t readLittle(const uint8_t* bytes, int count) {
    uint32_t value = 0;
    for (int i = count; i-- > 0;) value = value << 8 | bytes[i];
    return value;
}

} // namespace

SWaveData findWaveData(const CImageFile& file) {
    const auto refuse = [&](const char* reason) -> CDiscError {
        return {DISCIO_ERROR_UNSUPPORTED_FORMAT, file.getPath() + reason};
    };
    uint8_t head[12];
    if (file.read(0, head, 12) < 12 || std::memcmp(head, "RIFF", 4) != 0 ||
        std::memcmp(head + 8, "WAVE", 4) != 0)
        throw refuse(" is not a WAV file");
    bool isKnown = false;
    for (int64_t offset = 12; offset + 8 <= file.getSize();) {
        uint8_t chunk[8 + 16];
        const size_t count = file.read(offset, chunk, sizeof chunk);
        const int64_t size = readLittle(chunk + 4, 4);
        if (std::memcmp(chunk, "fmt ", 4) == 0 && count == sizeof chunk) {
            const uint32_t tag = readLittle(chunk + 8, 2);
            if ((tag != 1 && tag != 0xFFFE) || readLittle(chunk + 10, 2) != 2 ||
                readLittle(chunk + 12, 4) != 44100 || readLittle(chunk + 22, 2) != 16)
                throw refuse(" is not PCM of 16 bits in stereo at 44100 Hz");
            isKnown = true;
        } else if (std::memcmp(chunk, "data", 4) == 0) {
            if (!isKnown) throw refuse(" has sound data before its format");
            return {offset + 8, std::min(size, file.getSize() - offset - 8)};
        }
        offset += 8 + size + size % 2;
    }
    throw refuse(" has no sound data");
}

} // namespace discio

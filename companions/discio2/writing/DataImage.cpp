#include "writing/ImageWriter.h"
#include "writing/IsoSource.h"
#include "writing/StagedFiles.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <system_error>
#include <unistd.h>

namespace discio {

namespace {

constexpr size_t kPortion = 256 << 10;

// The sum of a file's portions that are not only zeros, and of where they are. Large files of zeros are
// frequent in disk images, and take no time here. Several times faster than a CRC, at which building an image
// of large files would spend most of its time.
class CPortionSum {
public:
    // Whether there is anything but zeros. The size is that of whole blocks.
    bool add(int64_t offset, const char* data, size_t size) {
        // Shifted by one it is equal to itself only if all bytes are the same.
        if (size == 0 || (data[0] == 0 && std::memcmp(data + 1, data, size - 1) == 0)) return false;
        m_lanes[0] += static_cast<uint64_t>(offset);
        for (size_t i = 0; i + sizeof m_lanes <= size; i += sizeof m_lanes) {
            Lanes words;
            std::memcpy(words.data(), data + i, sizeof words);
            for (size_t lane = 0; lane < words.size(); ++lane) {
                const uint64_t mixed = (m_lanes[lane] ^ words[lane]) * 0x9E3779B97F4A7C15;
                m_lanes[lane] = mixed ^ mixed >> 32;
            }
        }
        return true;
    }
    bool operator==(const CPortionSum&) const = default;

private:
    using Lanes = std::array<uint64_t, 4>; // independent of each other, so that they are computed together
    Lanes m_lanes{};
};

// Reads a file back, except for what the file system has no data of.
CPortionSum readSum(const std::string& path, int64_t size, const CProgress& progress) {
    const struct SFile {
        int file;
        ~SFile() { ::close(file); }
    } own{::open(path.c_str(), O_RDONLY | O_CLOEXEC)};
    const auto fail = [&] {
        throw CDiscError(DISCIO_ERROR_DEVICE,
                         path + " cannot be read back: " + std::generic_category().message(errno));
    };
    if (own.file < 0 || ::lseek(own.file, 0, SEEK_END) != size) fail();
    std::vector<char> portion(kPortion);
    CPortionSum sum;
    for (int64_t offset = 0; offset < size;) {
        const int64_t found = ::lseek(own.file, offset, SEEK_DATA);
        if (found < 0 && errno == ENXIO) break; // only zeros up to the end
        if (found > offset) offset = found - found % static_cast<int64_t>(kPortion);
        const auto wanted = static_cast<size_t>(std::min<int64_t>(kPortion, size - offset));
        for (size_t done = 0; done < wanted;) {
            const ssize_t count = ::pread(own.file, portion.data() + done, wanted - done,
                                          static_cast<off_t>(offset + static_cast<int64_t>(done)));
            if (count < 0 && errno == EINTR) continue;
            if (count <= 0) fail();
            done += static_cast<size_t>(count);
        }
        sum.add(offset, portion.data(), wanted);
        offset += static_cast<int64_t>(wanted);
        progress.report(DISCIO_PHASE_VERIFY, offset, size);
    }
    progress.report(DISCIO_PHASE_VERIFY, 1.0);
    return sum;
}

} // namespace

void requireExtension(const std::string& path, const char* extension) {
    std::string own = std::filesystem::path(path).extension();
    for (char& c : own)
        if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
    if (own != extension)
        throw CDiscError(DISCIO_ERROR_UNSUPPORTED_FORMAT,
                         path + ": an image of this project has the extension " + extension);
}

void writeDataImage(const CVirtualDataDisc& disc, const std::string& path, const CProgress& progress) {
    requireExtension(path, ".iso");
    progress.report(DISCIO_PHASE_PREPARE, 0.0);
    CStagedFiles staged(path);
    const std::string stagedPath = staged.getPath(staged.getName());
    std::vector<char> portion(kPortion);
    CPortionSum written;
    int64_t size = 0;
    {
        CIsoSource source(disc, 0);
        CNewFile file(stagedPath);
        while (const size_t count = source.read(portion.data(), portion.size())) {
            if (written.add(file.getSize(), portion.data(), count))
                file.write(portion.data(), count);
            else
                file.skip(static_cast<int64_t>(count));
            progress.report(DISCIO_PHASE_WRITE, file.getSize(), source.getSize());
        }
        size = file.getSize();
        progress.report(DISCIO_PHASE_FINISH, 0.0);
        file.finish();
        progress.report(DISCIO_PHASE_FINISH, 1.0);
    }
    if (readSum(stagedPath, size, progress) != written)
        throw CDiscError(DISCIO_ERROR_DEVICE, staged.getName() + " differs from what was written");
    staged.commit({staged.getName()});
}

} // namespace discio

#include "images/ImageLayout.h"
#include "writing/ImageWriter.h"
#include "writing/IsoSource.h"
#include "writing/StagedFiles.h"

#include <cstring>
#include <filesystem>
#include <zlib.h>

namespace discio {

namespace {

constexpr size_t kPortion = 256 << 10;

// The sum of a file's portions that are not only zeros, and of where they are. Large files of zeros are
// frequent in disk images, and a sum over them would take longest of all.
class CPortionSum {
public:
    // Whether there is anything but zeros.
    bool add(int64_t offset, const char* data, size_t size) {
        // Shifted by one it is equal to itself only if all bytes are the same.
        if (size == 0 || (data[0] == 0 && std::memcmp(data + 1, data, size - 1) == 0)) return false;
        m_sum = crc32(m_sum, reinterpret_cast<const Bytef*>(&offset), sizeof offset);
        m_sum = crc32(m_sum, reinterpret_cast<const Bytef*>(data), static_cast<uInt>(size));
        return true;
    }
    bool operator==(const CPortionSum&) const = default;

private:
    uLong m_sum = 0;
};

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
    CPortionSum written, found;
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
    const CImageFile file(stagedPath);
    for (int64_t offset = 0; offset < file.getSize();) {
        const size_t count = file.read(offset, portion.data(), portion.size());
        if (count == 0) break;
        found.add(offset, portion.data(), count);
        offset += static_cast<int64_t>(count);
        progress.report(DISCIO_PHASE_VERIFY, offset, size);
    }
    if (file.getSize() != size || found != written)
        throw CDiscError(DISCIO_ERROR_DEVICE, staged.getName() + " differs from what was written");
    staged.commit({staged.getName()});
}

} // namespace discio

// Treats arbitrary bytes as the entry of a UDF file, after 8 bytes of its size, and reads the file from
// several offsets: only blocks that exist may be asked for, and what is delivered is as long as announced.
#include "data/DataFile.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>

using namespace discio;

namespace {

constexpr size_t kEntryBytes = 2048;
constexpr int64_t kPartition = 270;

class CCheckedVolume : public IDataVolume {
public:
    std::string getTitle() override { return {}; }
    std::vector<SDataEntry> list(const DataPath&) override { return {}; }
    void readBlocks(int64_t block, int64_t count, void* to) override {
        if (block < kPartition || count <= 0 || count * 2048 > INT32_MAX) std::abort();
        std::memset(to, 1, static_cast<size_t>(count) * 2048);
    }
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size < sizeof(int64_t)) return 0;
    SDataEntry entry;
    std::memcpy(&entry.size, data, sizeof entry.size);
    std::string bytes(reinterpret_cast<const char*>(data) + sizeof entry.size, size - sizeof entry.size);
    bytes.resize(kEntryBytes);
    setUdfExtents(entry, bytes, kPartition);
    CCheckedVolume volume;
    std::vector<char> portion(10000);
    for (const int64_t offset : {int64_t{0}, int64_t{1}, int64_t{2047}, entry.size / 2, entry.size - 1}) {
        if (offset < 0) continue;
        try {
            const int64_t wanted = static_cast<int64_t>(portion.size());
            if (readFile(volume, entry, offset, portion.data(), wanted) !=
                std::max<int64_t>(std::min(entry.size - offset, wanted), 0))
                std::abort();
        } catch (const CDiscError&) {
        }
    }
    return 0;
}

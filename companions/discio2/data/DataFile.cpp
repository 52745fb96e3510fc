#include "data/DataFile.h"

#include "Medium.h"

#include <algorithm>
#include <array>
#include <cstring>

namespace discio {

namespace {

constexpr int64_t kBlock = kDataSectorBytes;

// Part of an extent; `inside` is the offset in it.
void readExtent(IDataVolume& volume, const SDataExtent& extent, int64_t inside, char* to, int64_t bytes) {
    if (extent.block < 0) {
        std::memset(to, 0, static_cast<size_t>(bytes));
        return;
    }
    std::array<char, kBlock> single;
    while (bytes > 0) {
        const int64_t block = extent.block + inside / kBlock;
        const int64_t skipped = inside % kBlock;
        int64_t some = bytes / kBlock * kBlock;
        if (skipped == 0 && some > 0) {
            volume.readBlocks(block, some / kBlock, to);
        } else {
            volume.readBlocks(block, 1, single.data());
            some = std::min(bytes, kBlock - skipped);
            std::memcpy(to, single.data() + skipped, static_cast<size_t>(some));
        }
        inside += some;
        to += some;
        bytes -= some;
    }
}

uint32_t getNumber(std::string_view bytes, size_t at) {
    uint32_t value = 0;
    for (size_t i = 4; i-- > 0;) value = value << 8 | static_cast<unsigned char>(bytes[at + i]);
    return value;
}

} // namespace

void IDataVolume::readBlocks(int64_t, int64_t, void*) {
    throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED, "the content of the files is not on a disc");
}

int64_t readFile(IDataVolume& volume, const SDataEntry& entry, int64_t offset, void* buffer, int64_t bytes) {
    if (entry.isFolder) throw CDiscError(DISCIO_ERROR_NOT_A_FILE, entry.name);
    if (!entry.source.empty())
        throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED, entry.name + " has not been written to a disc");
    if (!entry.isReadable)
        throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED, entry.name + " is stored in parts elsewhere");
    const int64_t wanted = std::clamp<int64_t>(entry.size - offset, 0, bytes);
    int64_t done = 0, start = 0;
    auto* to = static_cast<char*>(buffer);
    if (entry.extents.empty()) {
        const int64_t available = static_cast<int64_t>(entry.content.size()) - offset;
        done = std::clamp<int64_t>(available, 0, wanted);
        std::memcpy(to, entry.content.data() + (done > 0 ? offset : 0), static_cast<size_t>(done));
    }
    for (const SDataExtent& extent : entry.extents) {
        const int64_t inside = offset + done - start;
        start += extent.bytes;
        if (inside >= extent.bytes) continue;
        const int64_t some = std::min(wanted - done, extent.bytes - inside);
        if (some <= 0) break;
        readExtent(volume, extent, inside, to + done, some);
        done += some;
    }
    if (done < wanted)
        throw CDiscError(DISCIO_ERROR_BROKEN_FILE_SYSTEM, entry.name + " is shorter than its folder states");
    return done;
}

void setUdfExtents(SDataEntry& entry, std::string_view fileEntry, int64_t partitionStart) {
    constexpr size_t kFlags = 34, kAttributeBytes = 168, kDescriptorBytes = 172, kHeader = 176;
    constexpr int kShort = 0, kLong = 1, kInside = 3;
    const int form = fileEntry[kFlags] & 7;
    const size_t attributes = getNumber(fileEntry, kAttributeBytes);
    const size_t size = getNumber(fileEntry, kDescriptorBytes);
    entry.isReadable = entry.size >= 0 && attributes + size <= fileEntry.size() - kHeader;
    entry.size = std::max<int64_t>(entry.size, 0);
    if (!entry.isReadable) return;
    const std::string_view descriptors = fileEntry.substr(kHeader + attributes, size);
    if (form == kInside) {
        entry.content = descriptors;
        return;
    }
    const size_t step = form == kShort ? 8 : 16;
    int64_t total = 0;
    for (size_t i = 0; i + step <= descriptors.size() && total < entry.size; i += step) {
        const uint32_t length = getNumber(descriptors, i);
        const int64_t bytes = length & 0x3FFFFFFF;
        const uint32_t type = length >> 30; // 0 recorded, 1 and 2 zeros, 3 continued elsewhere
        if (bytes == 0) break;
        if (type == 3 || (form != kShort && form != kLong)) {
            entry.isReadable = false;
            return;
        }
        entry.extents.push_back({type == 0 ? partitionStart + getNumber(descriptors, i + 4) : -1, bytes});
        total += bytes;
    }
}

} // namespace discio

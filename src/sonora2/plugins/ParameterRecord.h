// Receives fixed parameter records of any version.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <type_traits>

namespace sonora2::common {

// Copies as many bytes as the record's first field (its size as int32) states into a zeroed record of our own
// size, whose first field is then set to that size. A shorter record from an older caller reads as zero where
// it ends; of a longer one, or one with a garbage size, at most our own size is read. Never reads beyond the
// stated size or `available` bytes.
template <class Record> Record receiveRecord(const void* bytes, size_t available = sizeof(Record)) {
    static_assert(std::is_trivially_copyable_v<Record> && std::is_standard_layout_v<Record>);
    static_assert(std::is_same_v<decltype(Record::nSize), int32_t>);
    constexpr int32_t kOwnSize = sizeof(Record);

    Record record;
    std::memset(static_cast<void*>(&record), 0, sizeof(record));
    if (bytes && available >= sizeof(int32_t)) {
        int32_t stated = 0;
        std::memcpy(&stated, bytes, sizeof(stated));
        const size_t size = static_cast<size_t>(std::clamp(stated, 0, kOwnSize));
        std::memcpy(static_cast<void*>(&record), bytes, std::min(size, available));
    }
    record.nSize = kOwnSize;
    return record;
}

// A null pointer gives a record of zeros.
template <class Record> Record receiveRecord(const Record* source) {
    return receiveRecord<Record>(static_cast<const void*>(source));
}

} // namespace sonora2::common

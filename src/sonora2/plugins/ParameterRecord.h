// The rule by which the fixed parameter records are received.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <type_traits>

namespace sonora2::common {

// Takes as many bytes as the record's first field (its size as int32) says into a zeroed record of our own
// size, whose first field then tells that size. A record from an older caller is shorter and reads as zero
// where it ends; of a longer one, or one whose size is garbage, no more than our own size is read. Nothing
// is read beyond the size that the caller states, nor beyond `available` bytes.
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

#include "filetag/rifftag/InfoList.h"

#include <algorithm>
#include <cstring>

namespace filetag::rifftag {

namespace {

constexpr size_t kListHeader = 12;
constexpr size_t kEntryHeader = sizeof(SChunkHeader);

} // namespace

CInfoList::CInfoList() : m_chunk{'L', 'I', 'S', 'T', 4, 0, 0, 0, 'I', 'N', 'F', 'O'} {}

CInfoList::CInfoList(std::vector<uint8_t> chunk) : m_chunk(std::move(chunk)) {}

bool CInfoList::getEntry(size_t offset, SEntry& entry) const {
    if (m_chunk.size() - offset < kEntryHeader) return false;
    SChunkHeader header;
    std::memcpy(&header, &m_chunk[offset], sizeof header);
    const size_t value = offset + kEntryHeader;
    const size_t size = std::min<size_t>(header.size, m_chunk.size() - value);
    size_t end = value + size;
    while (end < m_chunk.size() && m_chunk[end] == 0) ++end;
    entry = {offset, size, end};
    return true;
}

bool CInfoList::find(const FourCC& id, SEntry& entry) const {
    for (size_t offset = kListHeader; getEntry(offset, entry); offset = entry.end)
        if (std::memcmp(&m_chunk[offset], id.data(), id.size()) == 0) return true;
    return false;
}

std::string_view CInfoList::get(const FourCC& id) const {
    SEntry entry;
    if (!find(id, entry)) return {};
    const std::string_view value(reinterpret_cast<const char*>(m_chunk.data()) + entry.offset + kEntryHeader,
                                 entry.size);
    return value.substr(0, value.find('\0'));
}

void CInfoList::set(const FourCC& id, std::string_view value) {
    SEntry entry;
    if (!find(id, entry)) {
        closeEnd();
        entry = {m_chunk.size(), 0, m_chunk.size() + kEntryHeader};
        m_chunk.reserve(entry.end + value.size() + 1);
        m_chunk.insert(m_chunk.end(), id.begin(), id.end());
        m_chunk.insert(m_chunk.end(), 4, 0);
    }
    const size_t begin = entry.offset + kEntryHeader;
    const size_t oldRoom = entry.end - begin;
    const size_t size = value.size() + 1;
    const bool hasPad = oldRoom > entry.size;
    const size_t newRoom = size + (hasPad ? size % 2 : 0);
    const auto at = [this](size_t offset) { return m_chunk.begin() + static_cast<ptrdiff_t>(offset); };
    if (newRoom > oldRoom) {
        m_chunk.reserve(m_chunk.size() - oldRoom + newRoom);
        m_chunk.insert(at(entry.end), newRoom - oldRoom, 0);
    } else {
        m_chunk.erase(at(begin + newRoom), at(entry.end));
    }
    std::copy(value.begin(), value.end(), at(begin));
    std::fill(at(begin + value.size()), at(begin + newRoom), 0);
    setSize(entry.offset, size);
}

std::vector<uint8_t> CInfoList::render(bool padded) const {
    std::vector<uint8_t> chunk(m_chunk.begin(), m_chunk.begin() + kListHeader);
    std::vector<uint8_t> unpadded;
    std::vector<FourCC> late; // ids of the entries in there
    SEntry entry{0, 0, kListHeader};
    while (getEntry(entry.end, entry)) {
        const size_t value = entry.offset + kEntryHeader;
        const bool odd = entry.size % 2 != 0;
        const bool hasPad = entry.end > value + entry.size;
        const SChunkHeader header{readId(entry.offset), static_cast<uint32_t>(entry.size)};
        // Of several entries of one id the first one counts, so that the others stay behind it.
        const bool isLate = std::find(late.begin(), late.end(), header.id) != late.end();
        const bool isLast = isLate || (odd && !padded && !hasPad);
        if (isLast && !isLate) late.push_back(header.id);
        std::vector<uint8_t>& target = isLast ? unpadded : chunk;
        const auto* bytes = reinterpret_cast<const uint8_t*>(&header);
        target.insert(target.end(), bytes, bytes + sizeof header);
        const auto begin = m_chunk.begin() + static_cast<ptrdiff_t>(value);
        target.insert(target.end(), begin, begin + static_cast<ptrdiff_t>(entry.size));
        if (odd && (padded || hasPad)) target.push_back(0);
    }
    chunk.insert(chunk.end(), unpadded.begin(), unpadded.end());
    const auto size = static_cast<uint32_t>(chunk.size() - kEntryHeader);
    std::memcpy(&chunk[sizeof(FourCC)], &size, sizeof size);
    return chunk;
}

FourCC CInfoList::readId(size_t offset) const {
    FourCC id;
    std::memcpy(id.data(), &m_chunk[offset], id.size());
    return id;
}

void CInfoList::closeEnd() {
    SEntry last{kListHeader, 0, kListHeader};
    for (SEntry entry; getEntry(last.end, entry);) last = entry;
    if (last.end > kListHeader) setSize(last.offset, last.size);
    m_chunk.resize(last.end);
}

void CInfoList::setSize(size_t offset, size_t size) {
    const auto value = static_cast<uint32_t>(size);
    std::memcpy(&m_chunk[offset + 4], &value, sizeof value);
}

} // namespace filetag::rifftag

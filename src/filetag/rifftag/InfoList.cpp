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
    const size_t newRoom = value.size() + 1;
    const auto at = [this](size_t offset) { return m_chunk.begin() + static_cast<ptrdiff_t>(offset); };
    if (newRoom > oldRoom) {
        m_chunk.reserve(m_chunk.size() - oldRoom + newRoom);
        m_chunk.insert(at(entry.end), newRoom - oldRoom, 0);
    } else {
        m_chunk.erase(at(begin + newRoom), at(entry.end));
    }
    std::copy(value.begin(), value.end(), at(begin));
    m_chunk[begin + value.size()] = 0;
    setSize(entry.offset, newRoom);
}

const std::vector<uint8_t>& CInfoList::getChunk() {
    setSize(0, m_chunk.size() - kEntryHeader);
    return m_chunk;
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

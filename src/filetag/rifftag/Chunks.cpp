#include "filetag/rifftag/Chunks.h"

#include <algorithm>
#include <bit>
#include <string_view>

namespace filetag::rifftag {

// Headers are read and written in memory order.
static_assert(std::endian::native == std::endian::little);

namespace {

constexpr int64_t kOldTagSize = 128;

} // namespace

CChunkReader::CChunkReader(const P<peru::ISeekableInStream>& stream)
    : m_stream(stream), m_end(stream->getSize()) {
    struct {
        SChunkHeader riff;
        FourCC type;
    } header;
    static_assert(sizeof header == kHeaderSize);
    header = {};
    m_wave = readAt(0, &header, sizeof header) && header.riff.id == FourCC{'R', 'I', 'F', 'F'} &&
             header.type == FourCC{'W', 'A', 'V', 'E'};
    const int64_t told = header.riff.size + static_cast<int64_t>(sizeof header.riff);
    for (const int64_t end : {told, told + 1})
        if (m_wave && isTagAt(end)) m_end = end;
    m_sizeTold = told == m_end;
}

bool CChunkReader::next(SChunk& chunk) {
    SChunkHeader header;
    if (!readAt(m_offset, &header, sizeof header)) return false;
    const int64_t body = m_offset + static_cast<int64_t>(sizeof header);
    const int64_t left = m_end - body;
    int64_t size = std::min<int64_t>(header.size, left);
    if (size == 0 && !m_sizeTold && header.id == FourCC{'d', 'a', 't', 'a'} && !isIdAt(body)) size = left;

    FourCC type{};
    const bool info = header.id == FourCC{'L', 'I', 'S', 'T'} && size > 4 &&
                      readAt(body, &type, sizeof type) && type == FourCC{'I', 'N', 'F', 'O'};
    const bool padded = size % 2 != 0 && isPadAt(body + size);
    chunk = {m_offset, header.id, header.size, size, info};
    m_offset = body + size + (padded ? 1 : 0);
    return true;
}

bool CChunkReader::isTagAt(int64_t offset) {
    std::array<char, 8> start{};
    if (offset < kHeaderSize || !readAt(offset, start.data(), static_cast<int64_t>(start.size())))
        return false;
    const std::string_view text(start.data(), start.size());
    return text == "APETAGEX" || (text.starts_with("TAG") && offset + kOldTagSize == m_end);
}

bool CChunkReader::isIdAt(int64_t offset) {
    FourCC id;
    return readAt(offset, &id, sizeof id) &&
           std::all_of(id.begin(), id.end(), [](char c) { return c >= 0x20 && c < 0x7F; });
}

bool CChunkReader::isPadAt(int64_t offset) {
    uint8_t byte = 0;
    if (!readAt(offset, &byte, 1)) return false;
    return byte == 0 || offset + 1 == m_end || (!isIdAt(offset) && isIdAt(offset + 1));
}

bool CChunkReader::readAt(int64_t offset, void* bytes, int64_t size) {
    if (size > m_end - offset) return false;
    m_stream->seek(offset);
    return m_stream->readSome(bytes, size) == size;
}

} // namespace filetag::rifftag

#include "media/TrackReader.h"

#include "base/Translation.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <tonewright/host.h>
#include <vector>

namespace host {

namespace {

// Four tables, so that four bytes are looked up at once.
constexpr auto kCrcTables = [] {
    std::array<std::array<uint32_t, 256>, 4> tables{};
    for (uint32_t i = 0; i < 256; ++i) {
        uint32_t value = i;
        for (int bit = 0; bit < 8; ++bit) value = value >> 1 ^ (value & 1 ? 0xEDB88320u : 0);
        tables[0][i] = value;
    }
    for (size_t t = 1; t < 4; ++t)
        for (size_t i = 0; i < 256; ++i)
            tables[t][i] = tables[t - 1][i] >> 8 ^ tables[0][tables[t - 1][i] & 0xFF];
    return tables;
}();

} // namespace

uint32_t updateCrc32(uint32_t crc, const void* data, size_t size) {
    const auto* bytes = static_cast<const uint8_t*>(data);
    crc = ~crc;
    for (; size >= 4; size -= 4, bytes += 4) {
        crc ^= static_cast<uint32_t>(bytes[0]) | static_cast<uint32_t>(bytes[1]) << 8 |
               static_cast<uint32_t>(bytes[2]) << 16 | static_cast<uint32_t>(bytes[3]) << 24;
        crc = kCrcTables[3][crc & 0xFF] ^ kCrcTables[2][crc >> 8 & 0xFF] ^ kCrcTables[1][crc >> 16 & 0xFF] ^
              kCrcTables[0][crc >> 24];
    }
    for (; size > 0; --size) crc = crc >> 8 ^ kCrcTables[0][(crc ^ *bytes++) & 0xFF];
    return ~crc;
}

CTrackReader::CTrackReader(std::vector<SSection> sections) : m_sections(std::move(sections)) {
    for (const SSection& section : m_sections) m_count += section.count;
    if (!seek(0)) throw makeDiscError();
}

int64_t CTrackReader::getRepairs() const {
    int64_t repairs = 0;
    for (const SSection& section : m_sections) {
        const int64_t own = section.stream->funcs->getRepairs(section.stream->user);
        if (own < 0) return -1;
        repairs += own;
    }
    return repairs;
}

CHandle CTrackReader::createSource() {
    TONEWRIGHT_SourceCallbacks callbacks = {};
    callbacks.size = sizeof callbacks;
    callbacks.read = [](void* user, void* samples, int64_t frames) {
        return static_cast<CTrackReader*>(user)->read(samples, frames);
    };
    callbacks.seek = [](void* user, int64_t frame) {
        return int32_t{static_cast<CTrackReader*>(user)->seek(frame) ? 1 : 0};
    };
    return CHandle(TONEWRIGHT_Host_CreateSourceFromCallbacks(kDiscRate, 2, 2, m_count, &callbacks, this));
}

const CTrackReader::SSection& CTrackReader::findSection(int64_t frame, int64_t& inside) const {
    size_t index = 0;
    for (inside = frame; index + 1 < m_sections.size() && inside >= m_sections[index].count; ++index)
        inside -= m_sections[index].count;
    return m_sections[index];
}

int64_t CTrackReader::read(void* samples, int64_t frames) {
    int32_t delivered = 0;
    int64_t inside = 0;
    const SSection& section = findSection(m_frames, inside);
    const DISCIO_PCMAudioStream& stream = *section.stream;
    const auto wanted = static_cast<int32_t>(std::min({frames, section.count - inside, int64_t{1} << 20}));
    if ((inside == 0 && stream.funcs->seek(stream.user, section.first) != 1) ||
        stream.funcs->read(stream.user, samples, wanted, &delivered) != 1) {
        m_reason = makeDiscError().what();
        return -1;
    }
    const auto* values = static_cast<const int16_t*>(samples);
    m_crc = updateCrc32(m_crc, samples, static_cast<size_t>(delivered) * 4);
    m_frames += delivered;
    int peak = m_peak;
    for (int32_t i = 0; i < 2 * delivered; ++i) peak = std::max(peak, std::abs(int{values[i]}));
    m_peak = peak;
    return delivered;
}

void CTrackReader::restart() {
    m_crc = 0;
    m_frames = 0;
    m_peak = 0;
    m_reason.clear();
}

// An encoder goes back to the start after it has looked at the source.
bool CTrackReader::seek(int64_t frame) {
    restart();
    m_frames = frame; // a checksum of anything but the whole is worth nothing
    int64_t inside = 0;
    const SSection& section = findSection(frame, inside);
    return section.stream->funcs->seek(section.stream->user, section.first + inside) == 1;
}

void CTrackReader::requireComplete() const {
    if (!m_reason.empty()) throw std::runtime_error(m_reason);
    if (m_frames != m_count) throw std::runtime_error(tr("host.Rip.short", "The track ended early"));
}

bool CTrackReader::verify(const std::function<bool()>& stops) {
    const uint32_t crc = m_crc;
    if (!seek(0)) throw makeDiscError();
    std::vector<int16_t> block(size_t{2} * kBlockFrames * kBlocksPerSecond);
    for (int64_t count = 1; count > 0;) {
        if (stops()) return false;
        count = read(block.data(), kBlockFrames * kBlocksPerSecond);
    }
    requireComplete();
    if (m_crc != crc)
        throw std::runtime_error(tr("host.Rip.differs", "Reading the track again gave other samples"));
    return true;
}

} // namespace host

#include "media/TrackReader.h"

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

CTrackReader::CTrackReader(DiscHandle<DISCIO_PCMAudioStream> stream) : m_stream(std::move(stream)) {}

CHandle CTrackReader::createSource() {
    TONEWRIGHT_SourceCallbacks callbacks = {};
    callbacks.size = sizeof callbacks;
    callbacks.read = [](void* user, void* samples, int64_t frames) {
        return static_cast<CTrackReader*>(user)->read(samples, frames);
    };
    callbacks.seek = [](void* user, int64_t frame) {
        return int32_t{static_cast<CTrackReader*>(user)->seek(frame) ? 1 : 0};
    };
    return CHandle(TONEWRIGHT_Host_CreateSourceFromCallbacks(
        kDiscRate, 2, 2, m_stream->funcs->getFrameCount(m_stream->user), &callbacks, this));
}

int64_t CTrackReader::read(void* samples, int64_t frames) {
    int32_t delivered = 0;
    const auto wanted = static_cast<int32_t>(std::min<int64_t>(frames, 1 << 20));
    if (m_stream->funcs->read(m_stream->user, samples, wanted, &delivered) != 1) {
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
    return m_stream->funcs->seek(m_stream->user, frame) == 1;
}

void CTrackReader::requireComplete() const {
    if (!m_reason.empty()) throw std::runtime_error(m_reason);
    if (m_frames != m_stream->funcs->getFrameCount(m_stream->user))
        throw std::runtime_error("The track ended early");
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
    if (m_crc != crc) throw std::runtime_error("Reading the track again gave other samples");
    return true;
}

} // namespace host

#include "projects/SegmentReader.h"

#include <algorithm>

namespace discio {

CSegmentReader::CSegmentReader(const std::shared_ptr<IPcmStream>& stream, int64_t frames, const STrack& track)
    : m_track(track), m_frames(frames), m_stream(stream) {}

void CSegmentReader::read(int32_t block, int32_t count, int16_t* samples) {
    try {
        const int64_t first = int64_t{block - m_track.start} * kFramesPerSector;
        if (first != m_position) {
            m_isAtEnd = false;
            if (first < m_frames) m_stream->seek(first);
            m_position = first;
        }
        int32_t left = count * kFramesPerSector;
        int64_t available = std::clamp<int64_t>(m_frames - first, 0, left);
        while (available > 0 && !m_isAtEnd) {
            const int32_t delivered = m_stream->read(samples, static_cast<int32_t>(available));
            m_isAtEnd = delivered == 0;
            samples += size_t{2} * static_cast<size_t>(delivered);
            left -= delivered;
            available -= delivered;
        }
        std::fill_n(samples, size_t{2} * static_cast<size_t>(left), int16_t{0});
        m_position += int64_t{count} * kFramesPerSector;
    } catch (const CDiscError& error) {
        m_position = -1; // unknown from here on
        throw CDiscError(error.getCode(), "track " + std::to_string(m_track.number) + ": " + error.what());
    }
}

} // namespace discio

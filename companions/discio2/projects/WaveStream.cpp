#include "projects/WaveStream.h"

#include <algorithm>
#include <bit>

namespace discio {

void CWaveStream::seek(int64_t frame) {
    if (frame < 0 || frame > getFrameCount())
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "frame " + std::to_string(frame));
    m_position = frame;
}

int32_t CWaveStream::read(int16_t* samples, int32_t frames) {
    const auto count = static_cast<int32_t>(std::min<int64_t>(frames, getFrameCount() - m_position));
    const size_t bytes = m_file.read(m_data.offset + m_position * kFrameBytes, samples,
                                     static_cast<size_t>(count) * kFrameBytes);
    if constexpr (std::endian::native == std::endian::big)
        for (size_t i = 0; i < bytes / 2; ++i) {
            const auto value = static_cast<uint16_t>(samples[i]);
            samples[i] = static_cast<int16_t>(static_cast<uint16_t>(value << 8 | value >> 8));
        }
    m_position += static_cast<int64_t>(bytes / kFrameBytes);
    return static_cast<int32_t>(bytes / kFrameBytes);
}

} // namespace discio

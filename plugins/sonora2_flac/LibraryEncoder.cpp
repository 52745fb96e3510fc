#include "sonora2_flac/LibraryEncoder.h"

#include <algorithm>
#include <array>
#include <new>

namespace sonora2::plugins::flac {

namespace {

constexpr int kPlaneFrames = 4096; // per call of the library, so that they stay in the cache

} // namespace

CLibraryEncoder::CLibraryEncoder(const SStreamSettings& settings)
    : m_settings(settings), m_planes(static_cast<size_t>(kPlaneFrames) * settings.format.channels),
      m_encoder(FLAC__stream_encoder_new()) {
    if (!m_encoder) throw std::bad_alloc();
}

void CLibraryEncoder::configure() {
    FLAC__StreamEncoder* encoder = m_encoder.get();
    const SPcmFormat& format = m_settings.format;
    const uint32_t rate = static_cast<uint32_t>(format.rate);
    FLAC__stream_encoder_set_channels(encoder, static_cast<uint32_t>(format.channels));
    FLAC__stream_encoder_set_bits_per_sample(encoder, static_cast<uint32_t>(format.bytesPerSample * 8));
    FLAC__stream_encoder_set_sample_rate(encoder, rate);
    FLAC__stream_encoder_set_compression_level(encoder, static_cast<uint32_t>(m_settings.level));
    // Rates that a frame header cannot encode are still valid outside of the streamable subset.
    if (!FLAC__format_sample_rate_is_subset(rate)) FLAC__stream_encoder_set_streamable_subset(encoder, false);
}

bool CLibraryEncoder::process(const uint8_t* pcm, int frames) {
    const SPcmFormat& format = m_settings.format;
    std::array<FLAC__int32*, FLAC__MAX_CHANNELS> planes{};
    for (int i = 0; i < format.channels; ++i) planes[i] = m_planes.data() + int64_t{i} * kPlaneFrames;
    for (int done = 0; done < frames; done += kPlaneFrames) {
        const int count = std::min(frames - done, kPlaneFrames);
        const uint8_t* from = pcm + int64_t{done} * format.frameBytes();
        for (int i = 0; i < format.channels; ++i)
            pcm::unpackChannel(from + i * format.bytesPerSample, format.bytesPerSample, format.channels,
                               planes[i], static_cast<size_t>(count));
        if (!FLAC__stream_encoder_process(m_encoder.get(), planes.data(), static_cast<uint32_t>(count)))
            return false;
    }
    return true;
}

} // namespace sonora2::plugins::flac

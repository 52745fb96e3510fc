#include "sonora2_flac/FlacDecoder.h"

#include "support/Pcm.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <new>

namespace sonora2::plugins::flac {

CFlacDecoder::CFlacDecoder(const SMediaFile& file) : m_file(file) {}

SDecodedMedia CFlacDecoder::open(const SDecoderOptions&) {
    close();
    InputFile input = openForReading(m_file);
    m_decoder.reset(FLAC__stream_decoder_new());
    if (!m_decoder) throw std::bad_alloc();
    // The library owns the stream from here on.
    if (FLAC__stream_decoder_init_FILE(m_decoder.get(), input.release(), onFrame, onMetadata, onError,
                                       this) != FLAC__STREAM_DECODER_INIT_STATUS_OK)
        fail("could not read %s: the decoder does not start", m_file.getDisplayName());
    if (!FLAC__stream_decoder_process_until_end_of_metadata(m_decoder.get()) || m_bits == 0) {
        close();
        fail("could not read %s: no FLAC stream was found", m_file.getDisplayName());
    }
    if (m_total == 0) {
        if (m_scanned < 0) {
            m_scanned = countFrames();
            rewind();
        }
        m_total = m_scanned;
    }
    return {m_format, m_total, "FLAC"};
}

void CFlacDecoder::close() {
    m_decoder.reset();
    m_rest.clear();
    m_restStart = 0;
    m_damage = nullptr;
    m_position = m_total = 0;
    m_bits = 0;
}

int CFlacDecoder::read(uint8_t* pcm, int frames) {
    frames = static_cast<int>(std::min<int64_t>(frames, m_total - m_position));
    if (frames <= 0) return 0;
    const size_t frameBytes = static_cast<size_t>(m_format.frameBytes());
    if (m_restStart < m_rest.size()) {
        const size_t bytes = std::min(m_rest.size() - m_restStart, frames * frameBytes);
        std::memcpy(pcm, m_rest.data() + m_restStart, bytes);
        m_restStart += bytes;
        m_position += static_cast<int64_t>(bytes / frameBytes);
        return static_cast<int>(bytes / frameBytes);
    }
    m_rest.clear();
    m_restStart = 0;
    m_target = pcm;
    m_targetFrames = frames;
    m_taken = 0;
    while (m_taken == 0 && !m_damage) {
        if (!FLAC__stream_decoder_process_single(m_decoder.get()) && !m_damage)
            m_damage = FLAC__stream_decoder_get_resolved_state_string(m_decoder.get());
        if (FLAC__stream_decoder_get_state(m_decoder.get()) == FLAC__STREAM_DECODER_END_OF_STREAM) break;
    }
    m_target = nullptr;
    m_targetFrames = 0;
    m_position += m_taken;
    if (m_taken == 0) failDamaged();
    return m_taken;
}

void CFlacDecoder::seek(int64_t frame) {
    m_rest.clear();
    m_restStart = 0;
    m_damage = nullptr;
    m_taken = 0; // frames delivered during the seek go to the rest
    m_position = frame;
    if (frame >= m_total) return;
    if (FLAC__stream_decoder_seek_absolute(m_decoder.get(), static_cast<FLAC__uint64>(frame)) && !m_damage)
        return;
    // The index or a frame is damaged: positions before the damage can still be reached from the start.
    rewind();
    discard(frame);
}

void CFlacDecoder::discard(int64_t frames) {
    std::array<uint8_t, 16384> forgotten;
    const int step = static_cast<int>(forgotten.size()) / m_format.frameBytes();
    for (int64_t left = frames; left > 0;)
        left -= read(forgotten.data(), static_cast<int>(std::min<int64_t>(left, step)));
}

void CFlacDecoder::rewind() {
    m_rest.clear();
    m_restStart = 0;
    m_damage = nullptr;
    m_position = 0;
    const int64_t total = m_total;
    if (!FLAC__stream_decoder_reset(m_decoder.get()) ||
        !FLAC__stream_decoder_process_until_end_of_metadata(m_decoder.get()))
        fail("could not read %s: it cannot be rewound", m_file.getDisplayName());
    m_total = total;
}

int64_t CFlacDecoder::countFrames() {
    int64_t frames = 0;
    while (!m_damage && FLAC__stream_decoder_skip_single_frame(m_decoder.get())) {
        if (FLAC__stream_decoder_get_state(m_decoder.get()) == FLAC__STREAM_DECODER_END_OF_STREAM) break;
        frames += FLAC__stream_decoder_get_blocksize(m_decoder.get());
    }
    return frames;
}

bool CFlacDecoder::take(const FLAC__Frame& frame, const FLAC__int32* const planes[]) {
    if (m_damage) return true;
    const FLAC__FrameHeader& header = frame.header;
    if (static_cast<int>(header.channels) != m_format.channels ||
        static_cast<int>(header.bits_per_sample) != m_bits) {
        m_damage = "the format changes within the stream";
        return false;
    }
    const int shift = m_format.bytesPerSample * 8 - m_bits;
    const int frames = static_cast<int>(header.blocksize);
    const int direct = std::min(frames, m_targetFrames - m_taken);
    const int frameBytes = m_format.frameBytes();
    if (direct > 0) {
        pcm::packPlanes(planes, m_format.channels, m_target + int64_t{m_taken} * frameBytes,
                        m_format.bytesPerSample, static_cast<size_t>(direct), shift);
        m_taken += direct;
    }
    if (direct < frames) {
        std::array<const FLAC__int32*, FLAC__MAX_CHANNELS> tails{};
        for (int i = 0; i < m_format.channels; ++i) tails[i] = planes[i] + direct;
        const size_t old = m_rest.size();
        m_rest.resize(old + static_cast<size_t>(frames - direct) * frameBytes);
        pcm::packPlanes(tails.data(), m_format.channels, m_rest.data() + old, m_format.bytesPerSample,
                        static_cast<size_t>(frames - direct), shift);
    }
    return true;
}

void CFlacDecoder::failDamaged() const {
    if (m_damage)
        fail("%s is damaged behind %.3f seconds: %s", m_file.getDisplayName(),
             static_cast<double>(m_position) / m_format.rate, m_damage);
    fail("%s ends after %.3f of %.3f seconds", m_file.getDisplayName(),
         static_cast<double>(m_position) / m_format.rate, static_cast<double>(m_total) / m_format.rate);
}

FLAC__StreamDecoderWriteStatus CFlacDecoder::onFrame(const FLAC__StreamDecoder*, const FLAC__Frame* frame,
                                                     const FLAC__int32* const planes[], void* self) {
    CFlacDecoder* decoder = static_cast<CFlacDecoder*>(self);
    try {
        if (decoder->take(*frame, planes)) return FLAC__STREAM_DECODER_WRITE_STATUS_CONTINUE;
    } catch (const std::bad_alloc&) {
        decoder->m_damage = "out of memory";
    }
    return FLAC__STREAM_DECODER_WRITE_STATUS_ABORT;
}

void CFlacDecoder::onMetadata(const FLAC__StreamDecoder*, const FLAC__StreamMetadata* block, void* self) {
    if (block->type != FLAC__METADATA_TYPE_STREAMINFO) return;
    CFlacDecoder* decoder = static_cast<CFlacDecoder*>(self);
    const FLAC__StreamMetadata_StreamInfo& info = block->data.stream_info;
    decoder->m_bits = static_cast<int>(info.bits_per_sample);
    decoder->m_format = {static_cast<int>(info.sample_rate), static_cast<int>(info.channels),
                         (decoder->m_bits + 7) / 8};
    decoder->m_total = static_cast<int64_t>(info.total_samples);
}

void CFlacDecoder::onError(const FLAC__StreamDecoder*, FLAC__StreamDecoderErrorStatus status, void* self) {
    CFlacDecoder* decoder = static_cast<CFlacDecoder*>(self);
    if (!decoder->m_damage) decoder->m_damage = FLAC__StreamDecoderErrorStatusString[status];
}

} // namespace sonora2::plugins::flac

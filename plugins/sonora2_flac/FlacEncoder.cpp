#include "sonora2_flac/FlacEncoder.h"

#include "support/Pcm.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <new>
#include <utility>

namespace sonora2::plugins::flac {

namespace {

constexpr int kDefaultLevel = 5;
constexpr int kHighestLevel = 8;
constexpr int kBlockFrames = 4096; // per call of the library, so that they stay in the cache

// Space for the seek table is reserved before the length is known. When a long file has filled it, every
// second point is dropped and the spacing doubles.
constexpr int kSeekPoints = 240;
constexpr int kSeekSeconds = 10;
constexpr int kSeekPointBytes = 18;
constexpr int kBlockHeaderBytes = 4;
constexpr int kPaddingBytes = 8192;
constexpr int kHeaderBytes =
    4 + kBlockHeaderBytes + 34 + 2 * kBlockHeaderBytes + kSeekPoints * kSeekPointBytes + kPaddingBytes + 48;
constexpr double kTypicalRatio = 0.6;

void putBigEndian(uint8_t* at, uint64_t value, int bytes) {
    for (int i = bytes - 1; i >= 0; --i, value >>= 8) at[i] = static_cast<uint8_t>(value);
}

} // namespace

CFlacEncoder::CFlacEncoder() = default;

CFlacEncoder::~CFlacEncoder() {
    m_file = nullptr; // deleting the library's encoder finishes the stream
}

bool CFlacEncoder::accepts(const SPcmFormat& format) const {
    if (format.channels <= static_cast<int>(FLAC__MAX_CHANNELS) &&
        FLAC__format_sample_rate_is_valid(static_cast<uint32_t>(format.rate)))
        return true;
    fail({"sonora2.CFlacEncoder.formats",
          "FLAC files hold 1 to %d channels at up to %d Hz, not %d channels at %d Hz"},
         FLAC__MAX_CHANNELS, FLAC__MAX_SAMPLE_RATE, format.channels, format.rate);
}

void CFlacEncoder::open(COutputFile& file, const SEncoderSettings& settings) {
    m_file = &file;
    m_format = settings.format;
    m_planes.resize(static_cast<size_t>(kBlockFrames) * m_format.channels);
    m_seekSpacing = int64_t{kSeekSeconds} * m_format.rate;
    m_encoder.reset(FLAC__stream_encoder_new());
    m_seekTable.reset(FLAC__metadata_object_new(FLAC__METADATA_TYPE_SEEKTABLE));
    m_padding.reset(FLAC__metadata_object_new(FLAC__METADATA_TYPE_PADDING));
    if (!m_encoder || !m_seekTable || !m_padding ||
        !FLAC__metadata_object_seektable_template_append_placeholders(m_seekTable.get(), kSeekPoints))
        throw std::bad_alloc();
    m_padding->length = kPaddingBytes;
    std::array<FLAC__StreamMetadata*, 2> blocks{m_seekTable.get(), m_padding.get()};

    FLAC__StreamEncoder* encoder = m_encoder.get();
    const uint32_t rate = static_cast<uint32_t>(m_format.rate);
    const int level =
        settings.quality ? static_cast<int>(std::lround(*settings.quality * kHighestLevel)) : kDefaultLevel;
    FLAC__stream_encoder_set_channels(encoder, static_cast<uint32_t>(m_format.channels));
    FLAC__stream_encoder_set_bits_per_sample(encoder, static_cast<uint32_t>(m_format.bytesPerSample * 8));
    FLAC__stream_encoder_set_sample_rate(encoder, rate);
    FLAC__stream_encoder_set_compression_level(encoder, static_cast<uint32_t>(level));
    // Rates that a frame header cannot encode are still valid outside of the streamable subset.
    if (!FLAC__format_sample_rate_is_subset(rate)) FLAC__stream_encoder_set_streamable_subset(encoder, false);
    FLAC__stream_encoder_set_metadata(encoder, blocks.data(), blocks.size());
    const FLAC__StreamEncoderInitStatus status =
        FLAC__stream_encoder_init_stream(encoder, onWrite, onSeek, onTell, nullptr, this);
    if (status == FLAC__STREAM_ENCODER_INIT_STATUS_OK) return;
    file.throwFailure();
    fail({"sonora2.plugins.write", "could not write %s: %s"}, file.getFile().getDisplayName(),
         FLAC__StreamEncoderInitStatusString[status]);
}

void CFlacEncoder::write(const uint8_t* pcm, int frames) {
    std::array<FLAC__int32*, FLAC__MAX_CHANNELS> planes{};
    for (int i = 0; i < m_format.channels; ++i) planes[i] = m_planes.data() + int64_t{i} * kBlockFrames;
    for (int done = 0; done < frames; done += kBlockFrames) {
        const int count = std::min(frames - done, kBlockFrames);
        const uint8_t* from = pcm + int64_t{done} * m_format.frameBytes();
        for (int i = 0; i < m_format.channels; ++i)
            pcm::unpackChannel(from + i * m_format.bytesPerSample, m_format.bytesPerSample, m_format.channels,
                               planes[i], static_cast<size_t>(count));
        if (!FLAC__stream_encoder_process(m_encoder.get(), planes.data(), static_cast<uint32_t>(count)))
            failEncoding();
    }
}

void CFlacEncoder::finish() {
    // The library completes length, frame sizes and checksum; we write the table.
    if (!FLAC__stream_encoder_finish(m_encoder.get())) failEncoding();
    writeSeekTable();
    m_file = nullptr;
}

int64_t CFlacEncoder::estimateBytes(double seconds, const SEncoderSettings& settings) const {
    const double bytes = seconds * settings.format.rate * settings.format.frameBytes();
    return kHeaderBytes + std::llround(bytes * kTypicalRatio);
}

void CFlacEncoder::addSeekPoint(int64_t offset, uint32_t frames) {
    const int64_t next = (m_encoded + m_seekSpacing - 1) / m_seekSpacing * m_seekSpacing;
    if (next >= m_encoded + frames) return;
    if (m_seekPoints.size() == kSeekPoints) {
        for (size_t i = 0; i < kSeekPoints / 2; ++i) m_seekPoints[i] = m_seekPoints[2 * i];
        m_seekPoints.resize(kSeekPoints / 2);
        m_seekSpacing *= 2;
    }
    m_seekPoints.push_back({m_encoded, offset, frames});
}

void CFlacEncoder::writeSeekTable() {
    if (m_seekTableStart < 0 || m_seekPoints.empty()) return;
    std::vector<uint8_t> table(m_seekPoints.size() * kSeekPointBytes);
    uint8_t* at = table.data();
    for (const SSeekPoint& point : m_seekPoints) {
        putBigEndian(at, static_cast<uint64_t>(point.frame), 8);
        putBigEndian(at + 8, static_cast<uint64_t>(point.offset), 8);
        putBigEndian(at + 16, point.frames, 2);
        at += kSeekPointBytes;
    }
    m_file->seek(m_seekTableStart);
    m_file->write(table.data(), table.size());
}

void CFlacEncoder::failEncoding() {
    COutputFile* file = std::exchange(m_file, nullptr);
    file->throwFailure();
    fail({"sonora2.plugins.write", "could not write %s: %s"}, file->getFile().getDisplayName(),
         FLAC__stream_encoder_get_resolved_state_string(m_encoder.get()));
}

FLAC__StreamEncoderWriteStatus CFlacEncoder::onWrite(const FLAC__StreamEncoder*, const FLAC__byte data[],
                                                     size_t size, uint32_t samples, uint32_t, void* self) {
    CFlacEncoder* encoder = static_cast<CFlacEncoder*>(self);
    COutputFile* file = encoder->m_file;
    if (!file) return FLAC__STREAM_ENCODER_WRITE_STATUS_FATAL_ERROR;
    if (samples > 0) {
        if (encoder->m_soundStart < 0) encoder->m_soundStart = file->tell();
        encoder->addSeekPoint(file->tell() - encoder->m_soundStart, samples);
        encoder->m_encoded += samples;
    } else if (encoder->m_seekTableStart < 0 && size == kBlockHeaderBytes + kSeekPoints * kSeekPointBytes &&
               (data[0] & 0x7F) == FLAC__METADATA_TYPE_SEEKTABLE) {
        // The header arrives one metadata block per call.
        encoder->m_seekTableStart = file->tell() + kBlockHeaderBytes;
    }
    return file->tryWrite(data, size) ? FLAC__STREAM_ENCODER_WRITE_STATUS_OK
                                      : FLAC__STREAM_ENCODER_WRITE_STATUS_FATAL_ERROR;
}

FLAC__StreamEncoderSeekStatus CFlacEncoder::onSeek(const FLAC__StreamEncoder*, FLAC__uint64 position,
                                                   void* self) {
    COutputFile* file = static_cast<CFlacEncoder*>(self)->m_file;
    return file && file->trySeek(static_cast<int64_t>(position)) ? FLAC__STREAM_ENCODER_SEEK_STATUS_OK
                                                                 : FLAC__STREAM_ENCODER_SEEK_STATUS_ERROR;
}

FLAC__StreamEncoderTellStatus CFlacEncoder::onTell(const FLAC__StreamEncoder*, FLAC__uint64* position,
                                                   void* self) {
    const COutputFile* file = static_cast<CFlacEncoder*>(self)->m_file;
    if (!file) return FLAC__STREAM_ENCODER_TELL_STATUS_ERROR;
    *position = static_cast<FLAC__uint64>(file->tell());
    return FLAC__STREAM_ENCODER_TELL_STATUS_OK;
}

} // namespace sonora2::plugins::flac

#include "sonora2_flac/FlacEncoder.h"

#include "peru/threads/ThreadBudget.h"
#include "support/Pcm.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <new>
#include <utility>

namespace sonora2::plugins::flac {

namespace {

constexpr int kDefaultLevel = 5;
constexpr int kHighestLevel = 8;

// Space for the seek table is reserved before the length is known. When a long file has filled it, every
// second point is dropped and the spacing doubles.
constexpr int kSeekPoints = 240;
constexpr int kSeekSeconds = 10;
constexpr int kSeekPointBytes = 18;
constexpr int kBlockHeaderBytes = 4;
constexpr int64_t kStreamInfoStart = 4 + kBlockHeaderBytes;
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
    m_parallel.reset(); // its threads call this object
    m_file = nullptr;   // deleting the library's encoder finishes the stream
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
    m_seekSpacing = int64_t{kSeekSeconds} * m_format.rate;
    SStreamSettings stream{m_format, kDefaultLevel};
    if (settings.quality) stream.level = static_cast<int>(std::lround(*settings.quality * kHighestLevel));
    m_encoder = std::make_unique<CLibraryEncoder>(stream);
    m_seekTable.reset(FLAC__metadata_object_new(FLAC__METADATA_TYPE_SEEKTABLE));
    m_padding.reset(FLAC__metadata_object_new(FLAC__METADATA_TYPE_PADDING));
    if (!m_seekTable || !m_padding ||
        !FLAC__metadata_object_seektable_template_append_placeholders(m_seekTable.get(), kSeekPoints))
        throw std::bad_alloc();
    m_padding->length = kPaddingBytes;
    std::array<FLAC__StreamMetadata*, 2> blocks{m_seekTable.get(), m_padding.get()};

    FLAC__StreamEncoder* encoder = m_encoder->get();
    m_encoder->configure();
    FLAC__stream_encoder_set_metadata(encoder, blocks.data(), blocks.size());
    const FLAC__StreamEncoderInitStatus status =
        FLAC__stream_encoder_init_stream(encoder, onWrite, onSeek, onTell, nullptr, this);
    if (status != FLAC__STREAM_ENCODER_INIT_STATUS_OK) {
        file.throwFailure();
        failEncoding(FLAC__StreamEncoderInitStatusString[status]);
    }
    if (peru::getThreadBudget().getLimit() > 1 && CFrameRunEncoder::canSplit(stream)) {
        const int blockFrames = static_cast<int>(FLAC__stream_encoder_get_blocksize(encoder));
        m_parallel = std::make_unique<CParallelEncoder>(stream, blockFrames, static_cast<IFrameSink&>(*this));
        MD5Init(&m_hash);
    }
}

void CFlacEncoder::write(const uint8_t* pcm, int frames) {
    if (m_parallel) {
        m_parallel->write(pcm, frames);
    } else if (!m_encoder->process(pcm, frames)) {
        failEncoding(getState());
    }
}

void CFlacEncoder::update() {
    // What arrives slowly, from a recorder for example, is in the file all the same.
    if (m_parallel && !m_parallel->takeProgress()) m_parallel->flush();
}

void CFlacEncoder::finish() {
    if (const std::vector<uint8_t>* whole = m_parallel ? m_parallel->getUncut() : nullptr) {
        if (!m_encoder->process(whole->data(), static_cast<int>(whole->size()) / m_format.frameBytes()))
            failEncoding(getState());
        m_parallel.reset();
    }
    if (m_parallel) {
        m_parallel->finish();
        writeStreamInfo();
    } else if (!FLAC__stream_encoder_finish(m_encoder->get())) {
        // The library completes length, frame sizes and checksum.
        failEncoding(getState());
    }
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

void CFlacEncoder::addFrame(const uint8_t* bytes, size_t size, uint32_t samples) {
    const uint32_t frameBytes = static_cast<uint32_t>(size);
    m_smallestFrame = m_smallestFrame == 0 ? frameBytes : std::min(m_smallestFrame, frameBytes);
    m_largestFrame = std::max(m_largestFrame, frameBytes);
    noteFrame(samples);
    m_file->write(bytes, size);
}

void CFlacEncoder::noteFrame(uint32_t samples) {
    if (m_soundStart < 0) m_soundStart = m_file->tell();
    addSeekPoint(m_file->tell() - m_soundStart, samples);
    m_encoded += samples;
}

void CFlacEncoder::addToHash(const std::vector<uint8_t>& pcm) noexcept {
    if (m_format.bytesPerSample > 1) return MD5Update(&m_hash, pcm.data(), pcm.size());
    std::array<uint8_t, 4096> part; // the checksum is of signed samples
    for (size_t at = 0; at < pcm.size(); at += part.size()) {
        const size_t size = std::min(pcm.size() - at, part.size());
        std::memcpy(part.data(), &pcm[at], size);
        pcm::flipSign8(part.data(), size);
        MD5Update(&m_hash, part.data(), size);
    }
}

// What the library writes at the end of a stream that it has encoded itself. Source: RFC 9639, section 8.2.
void CFlacEncoder::writeStreamInfo() {
    std::array<uint8_t, 6> frameSizes;
    putBigEndian(frameSizes.data(), m_smallestFrame, 3);
    putBigEndian(frameSizes.data() + 3, m_largestFrame, 3);
    m_file->seek(kStreamInfoStart + 4);
    m_file->write(frameSizes.data(), frameSizes.size());

    // Rate, channels, width of the samples, length.
    const uint64_t length = m_encoded < int64_t{1} << 36 ? static_cast<uint64_t>(m_encoded) : 0;
    std::array<uint8_t, 8 + MD5_DIGEST_LENGTH> rest;
    putBigEndian(rest.data(),
                 uint64_t(m_format.rate) << 44 | uint64_t(m_format.channels - 1) << 41 |
                     uint64_t(m_format.bytesPerSample * 8 - 1) << 36 | length,
                 8);
    MD5Final(rest.data() + 8, &m_hash);
    m_file->write(rest.data(), rest.size());
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

const char* CFlacEncoder::getState() const {
    return FLAC__stream_encoder_get_resolved_state_string(m_encoder->get());
}

void CFlacEncoder::failEncoding(const char* reason) {
    COutputFile* file = std::exchange(m_file, nullptr);
    file->throwFailure();
    fail({"sonora2.plugins.write", "could not write %s: %s"}, file->getFile().getDisplayName(), reason);
}

FLAC__StreamEncoderWriteStatus CFlacEncoder::onWrite(const FLAC__StreamEncoder*, const FLAC__byte data[],
                                                     size_t size, uint32_t samples, uint32_t, void* self) {
    CFlacEncoder* encoder = static_cast<CFlacEncoder*>(self);
    COutputFile* file = encoder->m_file;
    if (!file) return FLAC__STREAM_ENCODER_WRITE_STATUS_FATAL_ERROR;
    if (samples > 0) {
        encoder->noteFrame(samples);
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

#include "sonora2_flac/FlacDecoder.h"

#include "support/Pcm.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <new>
#include <string_view>
#include <sys/stat.h>
#include <utility>

namespace sonora2::plugins::flac {

namespace {

constexpr int kSearchedBytes = 64 * 1024; // for the start of the stream

constexpr peru::SLocalizedText kBadHeader{"sonora2.CFlacDecoder.badHeader",
                                          "the header of a frame is damaged"};
constexpr peru::SLocalizedText kBadChecksum{"sonora2.CFlacDecoder.badChecksum",
                                            "the checksum of a frame is wrong"};
constexpr peru::SLocalizedText kBadData{"sonora2.CFlacDecoder.badData", "the data of a frame is invalid"};
constexpr peru::SLocalizedText kMissing{"sonora2.CFlacDecoder.missing", "data is missing or overwritten"};
constexpr peru::SLocalizedText kNoMemory{"sonora2.CFlacDecoder.noMemory", "out of memory"};

const peru::SLocalizedText& describe(FLAC__StreamDecoderErrorStatus status) {
    switch (status) {
    case FLAC__STREAM_DECODER_ERROR_STATUS_BAD_HEADER:
        return kBadHeader;
    case FLAC__STREAM_DECODER_ERROR_STATUS_FRAME_CRC_MISMATCH:
        return kBadChecksum;
    case FLAC__STREAM_DECODER_ERROR_STATUS_UNPARSEABLE_STREAM:
        return kBadData;
    default:
        return kMissing;
    }
}

bool isSilent(const FLAC__Frame& frame, const FLAC__int32* const planes[]) {
    const auto isZero = [&](const FLAC__int32* plane) {
        return std::all_of(plane, plane + frame.header.blocksize,
                           [](FLAC__int32 value) { return value == 0; });
    };
    return std::all_of(planes, planes + frame.header.channels, isZero);
}

} // namespace

CFlacDecoder::CFlacDecoder(const SMediaFile& file) : m_file(file) {}

SDecodedMedia CFlacDecoder::open(const SDecoderOptions& options) {
    close();
    m_input = openForReading(m_file);
    const SFileIdentity identity = identify(m_input);
    if (options.salvage != m_options.salvage || identity != m_identity) m_scanned = -1;
    m_options = options;
    m_identity = identity;
    m_start = findStream();
    m_decoder.reset(FLAC__stream_decoder_new());
    if (!m_decoder) throw std::bad_alloc();
    if (FLAC__stream_decoder_init_stream(m_decoder.get(), onRead, onSeek, onTell, onLength, onEof, onFrame,
                                         onMetadata, onError, this) != FLAC__STREAM_DECODER_INIT_STATUS_OK)
        fail({"sonora2.CFlacDecoder.noStart", "could not read %s: the decoder does not start"},
             m_file.getDisplayName());
    readMetadata();
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
    m_input.reset();
    forget();
    m_position = m_total = 0;
    m_bits = 0;
}

// Skips tags and at most some other data before the stream.
int64_t CFlacDecoder::findStream() {
    std::vector<char> bytes(kSearchedBytes);
    int64_t offset = 0;
    while (::fseeko(m_input.get(), offset, SEEK_SET) == 0) {
        const std::string_view text(bytes.data(), std::fread(bytes.data(), 1, bytes.size(), m_input.get()));
        if (text.size() < 10 || !text.starts_with("ID3")) {
            const size_t found = text.find("fLaC");
            if (found != text.npos) offset += static_cast<int64_t>(found);
            break;
        }
        int64_t size = 0;
        for (size_t i = 6; i < 10; ++i) size = size << 7 | (text[i] & 0x7F);
        const bool hasFooter = text[5] & 0x10;
        offset += 10 + size + (hasFooter ? 10 : 0);
    }
    ::fseeko(m_input.get(), offset, SEEK_SET);
    return offset;
}

void CFlacDecoder::readMetadata() {
    if (!FLAC__stream_decoder_process_until_end_of_metadata(m_decoder.get()) || m_bits == 0)
        fail({"sonora2.CFlacDecoder.noStream", "could not read %s: no FLAC stream was found"},
             m_file.getDisplayName());
    forget(); // errors in metadata do not affect the sound
}

int CFlacDecoder::read(uint8_t* pcm, int frames) {
    frames = static_cast<int>(std::min<int64_t>(frames, m_total - m_position));
    if (frames <= 0) return 0;
    FLAC__StreamDecoder* decoder = m_decoder.get();
    const auto hasFrames = [this] { return m_taken > 0 || m_silence > 0 || m_restStart < m_rest.size(); };
    m_taken = 0;
    if (!hasFrames()) {
        m_rest.clear();
        m_restStart = 0;
        m_target = pcm;
        m_targetFrames = frames;
        bool isRunning = true;
        while (isRunning && !hasFrames() && !m_change && (!m_damage || m_options.salvage))
            isRunning = FLAC__stream_decoder_process_single(decoder) &&
                        FLAC__stream_decoder_get_state(decoder) != FLAC__STREAM_DECODER_END_OF_STREAM;
        m_target = nullptr;
        m_targetFrames = 0;
        // The last frame of an otherwise complete stream can be damaged, too.
        const int64_t left = m_total - m_position;
        if (!isRunning && !hasFrames()) {
            if (left > FLAC__MAX_BLOCK_SIZE)
                m_damage = nullptr; // the file was truncated
            else if (m_damage && m_options.salvage)
                fillGap(left);
            reportDamage();
        }
    }
    const int64_t before = m_position;
    m_position += std::exchange(m_taken, 0);
    if (m_position > before) return static_cast<int>(m_position - before);
    if (m_silence > 0) return deliverSilence(pcm, frames);
    if (m_restStart < m_rest.size()) return deliverRest(pcm, frames);
    if (m_change)
        fail({"sonora2.CFlacDecoder.change", "%s changes at %.3f seconds from %s, which is not supported"},
             m_file.getDisplayName(), toSeconds(m_position), m_change);
    if (m_damage && !m_options.salvage)
        fail({"sonora2.CFlacDecoder.damaged", "%s is damaged at %.3f seconds: %s"}, m_file.getDisplayName(),
             toSeconds(m_position), peru::format(*m_damage));
    return 0;
}

int CFlacDecoder::deliverSilence(uint8_t* pcm, int frames) {
    const int count = static_cast<int>(std::min<int64_t>(frames, m_silence));
    std::memset(pcm, getSilence(), static_cast<size_t>(count) * m_format.frameBytes());
    m_silence -= count;
    m_position += count;
    return count;
}

int CFlacDecoder::deliverRest(uint8_t* pcm, int frames) {
    const size_t frameBytes = static_cast<size_t>(m_format.frameBytes());
    const size_t bytes = std::min(m_rest.size() - m_restStart, frames * frameBytes);
    std::memcpy(pcm, m_rest.data() + m_restStart, bytes);
    m_restStart += bytes;
    const int count = static_cast<int>(bytes / frameBytes);
    m_position += count;
    return count;
}

void CFlacDecoder::seek(int64_t frame) {
    forget();
    m_position = frame;
    if (frame >= m_total) return;
    // Frames delivered during the seek go to the rest.
    if (FLAC__stream_decoder_seek_absolute(m_decoder.get(), static_cast<FLAC__uint64>(frame)) && !m_damage)
        return;
    // The index or a frame is damaged: positions before the damage can still be reached from the start.
    rewind();
    discard(frame);
}

std::unique_ptr<IDecoder> CFlacDecoder::createTwin() {
    auto twin = std::make_unique<CFlacDecoder>(m_file);
    twin->m_scanned = m_scanned;
    twin->m_identity = m_identity;
    return twin;
}

void CFlacDecoder::discard(int64_t frames) {
    std::array<uint8_t, 16384> forgotten;
    const int step = static_cast<int>(forgotten.size()) / m_format.frameBytes();
    for (int64_t left = frames; left > 0;) {
        const int count = read(forgotten.data(), static_cast<int>(std::min<int64_t>(left, step)));
        if (count == 0) return; // the next read finds the end, too
        left -= count;
    }
}

void CFlacDecoder::forget() {
    m_rest.clear();
    m_restStart = 0;
    m_silence = 0;
    m_taken = 0;
    m_next = m_damagedFrom = -1;
    m_damage = nullptr;
    m_badChecksum = false;
    m_change.reset();
}

void CFlacDecoder::rewind() {
    const int64_t total = m_total;
    if (!FLAC__stream_decoder_reset(m_decoder.get()))
        fail({"sonora2.CFlacDecoder.noRewind", "could not read %s: it cannot be rewound"},
             m_file.getDisplayName());
    readMetadata();
    m_position = 0;
    m_total = total;
}

int64_t CFlacDecoder::countFrames() {
    FLAC__StreamDecoder* decoder = m_decoder.get();
    const auto isAtEnd = [&] {
        return FLAC__stream_decoder_get_state(decoder) == FLAC__STREAM_DECODER_END_OF_STREAM;
    };
    int64_t frames = 0;
    if (m_options.salvage) {
        // Lost frames count as well.
        m_counting = true;
        while (FLAC__stream_decoder_process_single(decoder) && !isAtEnd()) frames = std::max(frames, m_next);
        m_counting = false;
        return frames;
    }
    while (!m_damage && FLAC__stream_decoder_skip_single_frame(decoder) && !isAtEnd())
        frames += FLAC__stream_decoder_get_blocksize(decoder);
    return frames;
}

bool CFlacDecoder::take(const FLAC__Frame& frame, const FLAC__int32* const planes[]) {
    // The library delivers a frame of silence in place of one with a wrong checksum, whose number may be
    // wrong.
    if (std::exchange(m_badChecksum, false) || (m_damage && !m_options.salvage)) return true;
    const FLAC__FrameHeader& header = frame.header;
    if (static_cast<int>(header.channels) != m_format.channels ||
        static_cast<int>(header.bits_per_sample) != m_bits ||
        static_cast<int>(header.sample_rate) != m_format.rate) {
        m_change = peru::format(
            {"sonora2.CFlacDecoder.fromTo", "%d Hz, %d channels, %d bits to %d Hz, %d channels, %d bits"},
            m_format.rate, m_format.channels, m_bits, header.sample_rate, header.channels,
            header.bits_per_sample);
        return false;
    }
    const int frames = static_cast<int>(header.blocksize);
    const int frameBytes = m_format.frameBytes();
    if (m_options.salvage) {
        const auto first = static_cast<int64_t>(header.number.sample_number);
        // A stream that was cut out of another one does not start at frame 0.
        const int64_t known = m_next >= 0 ? m_next : m_damage ? m_position : first;
        const int64_t gap = std::max<int64_t>(first - known, 0);
        if (!m_counting && getPending() + gap + frames > m_total) return true;
        m_next = first + frames;
        if (m_counting) return true;
        if (gap > 0) fillGap(gap);
        // After an error, the library fills gaps with frames of silence, too.
        if (m_damage && isSilent(frame, planes)) {
            addDamage(getPending(), frames);
        } else {
            m_damage = nullptr;
            reportDamage();
        }
    }
    const int shift = m_format.bytesPerSample * 8 - m_bits;
    const int direct = m_silence > 0 ? 0 : std::min(frames, m_targetFrames - m_taken);
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

int64_t CFlacDecoder::getPending() const {
    const size_t rest = (m_rest.size() - m_restStart) / static_cast<size_t>(m_format.frameBytes());
    return m_position + m_taken + m_silence + static_cast<int64_t>(rest);
}

void CFlacDecoder::fillGap(int64_t frames) {
    addDamage(getPending(), frames);
    if (m_restStart == m_rest.size())
        m_silence += frames;
    else
        m_rest.resize(m_rest.size() + static_cast<size_t>(frames * m_format.frameBytes()), getSilence());
}

void CFlacDecoder::addDamage(int64_t from, int64_t frames) {
    if (m_damagedFrom < 0) m_damagedFrom = from;
    m_damagedTo = from + frames;
}

void CFlacDecoder::reportDamage() {
    if (m_damagedFrom < 0) return;
    m_options.warn(
        {"sonora2.plugins.replaced", "%s is damaged: %.3f to %.3f seconds were replaced by silence"},
        m_file.getDisplayName(), toSeconds(m_damagedFrom), toSeconds(m_damagedTo));
    m_damagedFrom = -1;
}

FLAC__StreamDecoderReadStatus CFlacDecoder::onRead(const FLAC__StreamDecoder*, FLAC__byte buffer[],
                                                   size_t* bytes, void* self) {
    std::FILE* input = static_cast<CFlacDecoder*>(self)->m_input.get();
    *bytes = std::fread(buffer, 1, *bytes, input);
    if (*bytes > 0) return FLAC__STREAM_DECODER_READ_STATUS_CONTINUE;
    return std::ferror(input) ? FLAC__STREAM_DECODER_READ_STATUS_ABORT
                              : FLAC__STREAM_DECODER_READ_STATUS_END_OF_STREAM;
}

FLAC__StreamDecoderSeekStatus CFlacDecoder::onSeek(const FLAC__StreamDecoder*, FLAC__uint64 offset,
                                                   void* self) {
    const CFlacDecoder& decoder = *static_cast<CFlacDecoder*>(self);
    return ::fseeko(decoder.m_input.get(), decoder.m_start + static_cast<int64_t>(offset), SEEK_SET) == 0
               ? FLAC__STREAM_DECODER_SEEK_STATUS_OK
               : FLAC__STREAM_DECODER_SEEK_STATUS_ERROR;
}

FLAC__StreamDecoderTellStatus CFlacDecoder::onTell(const FLAC__StreamDecoder*, FLAC__uint64* offset,
                                                   void* self) {
    const CFlacDecoder& decoder = *static_cast<CFlacDecoder*>(self);
    *offset = static_cast<FLAC__uint64>(::ftello(decoder.m_input.get()) - decoder.m_start);
    return FLAC__STREAM_DECODER_TELL_STATUS_OK;
}

FLAC__StreamDecoderLengthStatus CFlacDecoder::onLength(const FLAC__StreamDecoder*, FLAC__uint64* length,
                                                       void* self) {
    const CFlacDecoder& decoder = *static_cast<CFlacDecoder*>(self);
    struct stat status {};
    if (::fstat(::fileno(decoder.m_input.get()), &status) != 0 || status.st_size < decoder.m_start)
        return FLAC__STREAM_DECODER_LENGTH_STATUS_ERROR;
    *length = static_cast<FLAC__uint64>(status.st_size - decoder.m_start);
    return FLAC__STREAM_DECODER_LENGTH_STATUS_OK;
}

FLAC__bool CFlacDecoder::onEof(const FLAC__StreamDecoder*, void* self) {
    return std::feof(static_cast<CFlacDecoder*>(self)->m_input.get()) != 0;
}

FLAC__StreamDecoderWriteStatus CFlacDecoder::onFrame(const FLAC__StreamDecoder*, const FLAC__Frame* frame,
                                                     const FLAC__int32* const planes[], void* self) {
    CFlacDecoder* decoder = static_cast<CFlacDecoder*>(self);
    try {
        if (decoder->take(*frame, planes)) return FLAC__STREAM_DECODER_WRITE_STATUS_CONTINUE;
    } catch (const std::bad_alloc&) {
        decoder->m_damage = &kNoMemory;
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
    if (!decoder->m_damage) decoder->m_damage = &describe(status);
    if (status == FLAC__STREAM_DECODER_ERROR_STATUS_FRAME_CRC_MISMATCH) decoder->m_badChecksum = true;
}

} // namespace sonora2::plugins::flac

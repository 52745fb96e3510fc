#include "sonora2_decmpa/MpegDecoder.h"

#include "sonora2_decmpa/SoundEnd.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <utility>

namespace sonora2::plugins {

namespace {

constexpr int kBytesPerSample = 2;
// Limits for skipping other data (an unknown tag, damage) before the first frame and before later frames.
constexpr long kFirstFrameBytes = 64 * 1024;
constexpr long kNextFrameBytes = 16 * 1024 * 1024;
// Frames decoded before the target of a seek. A frame may use bits stored in several earlier ones, and a seek
// must deliver the same samples as a run from the start.
constexpr long kRunUpFrames = 16;
// Entries of the seek index, spread evenly over the file. Between them, frame headers are followed.
constexpr long kPlaces = 2048;
// Delay in frames that every layer III decoder adds.
constexpr long kDecoderDelay = 529;
// The codec issues a separate read for each header and each frame.
constexpr size_t kInputBufferBytes = 64 * 1024;

} // namespace

ssize_t CMpegDecoder::readInput(void* self, void* data, size_t size) {
    auto& decoder = *static_cast<CMpegDecoder*>(self);
    std::FILE* file = decoder.m_input.get();
    const int64_t left = std::max<int64_t>(decoder.m_inputEnd - decoder.m_inputPosition, 0);
    const size_t got =
        fread_unlocked(data, 1, static_cast<size_t>(std::min(left, static_cast<int64_t>(size))), file);
    decoder.m_inputPosition += static_cast<int64_t>(got);
    return got == 0 && ferror_unlocked(file) ? -1 : static_cast<ssize_t>(got);
}

off_t CMpegDecoder::seekInput(void* self, off_t offset, int whence) {
    auto& decoder = *static_cast<CMpegDecoder*>(self);
    if (whence == SEEK_END) offset += decoder.m_inputEnd;
    if (whence == SEEK_CUR) offset += decoder.m_inputPosition;
    if (offset < 0 || ::fseeko(decoder.m_input.get(), offset, SEEK_SET) != 0) return -1;
    return decoder.m_inputPosition = offset;
}

SDecodedMedia CMpegDecoder::open(const SDecoderOptions& options) {
    close();
    m_options = options;
    m_input = openForReading(m_file);
    m_buffer.resize(kInputBufferBytes); // the C library's default buffer is small
    std::setvbuf(m_input.get(), m_buffer.data(), _IOFBF, m_buffer.size());
    m_inputEnd = findSoundEnd(m_input.get());
    m_inputPosition = 0;
    int error = MPG123_OK;
    m_handle.reset(mpg123_new(nullptr, &error));
    if (!m_handle)
        fail({"sonora2.plugins.open", "could not open %s: %s"}, m_file.getDisplayName(), describe(error));
    mpg123_handle* handle = m_handle.get();
    mpg123_param(handle, MPG123_ADD_FLAGS, MPG123_QUIET | MPG123_SKIP_ID3V2, 0);
    // Gapless mode would trust the length stated in the file.
    mpg123_param(handle, MPG123_REMOVE_FLAGS, MPG123_GAPLESS, 0);
    mpg123_param(handle, MPG123_RESYNC_LIMIT, kFirstFrameBytes, 0);
    mpg123_param(handle, MPG123_PREFRAMES, kRunUpFrames, 0);
    mpg123_param(handle, MPG123_INDEX_SIZE, kPlaces, 0);
    if (mpg123_replace_reader_handle(handle, readInput, seekInput, nullptr) != MPG123_OK ||
        mpg123_open_handle(handle, this) != MPG123_OK)
        failToOpen();
    m_format = readFormat();
    mpg123_param(handle, MPG123_RESYNC_LIMIT, kNextFrameBytes, 0);
    if (m_scan.identity != identify(m_input))
        scan();
    else if (mpg123_set_index(handle, m_scan.places.data(), m_scan.framesPerPlace, m_scan.places.size()) !=
             MPG123_OK)
        failToOpen();
    seek(0);
    m_mpegFrames = std::max(mpg123_spf(handle), 1);
    m_checkedUntil = 0;
    return {m_format, m_scan.frames, getCodecName()};
}

void CMpegDecoder::close() {
    m_handle.reset();
    m_input.reset();
    m_buffer = {};
}

SPcmFormat CMpegDecoder::readFormat() {
    mpg123_handle* handle = m_handle.get();
    long rate = 0;
    int channels = 0, encoding = 0;
    if (mpg123_getformat(handle, &rate, &channels, &encoding) != MPG123_OK) failToOpen();
    // Allow only this format from here on, so that a change within the file is reported as an error.
    mpg123_format_none(handle);
    if (mpg123_format(handle, rate, channels, MPG123_ENC_SIGNED_16) != MPG123_OK) failToOpen();
    return {static_cast<int>(rate), channels, kBytesPerSample};
}

std::string CMpegDecoder::getCodecName() {
    mpg123_frameinfo info{};
    if (mpg123_info(m_handle.get(), &info) != MPG123_OK) return {};
    return "MPEG audio layer " + std::string(static_cast<size_t>(std::clamp(info.layer, 1, 3)), 'I');
}

// Stated lengths may be wrong and many files have none, so the frames are counted.
void CMpegDecoder::scan() {
    mpg123_handle* handle = m_handle.get();
    m_scan = {};
    const off_t told = mpg123_length(handle);
    if (mpg123_scan(handle) != MPG123_OK) failToOpen();
    const off_t decoded = mpg123_length(handle);
    if (decoded < 0) failToOpen();
    SScan scan;
    scan.frames = decoded;
    long delay = -1, padding = -1;
    mpg123_getstate(handle, MPG123_ENC_DELAY, &delay, nullptr);
    mpg123_getstate(handle, MPG123_ENC_PADDING, &padding, nullptr);
    if (delay >= 0 && padding >= 0) {
        const int64_t before = delay + kDecoderDelay;
        // A truncated file has lost its padding first, and in a file longer than stated the padding is
        // somewhere in the middle.
        const int64_t behind = told == decoded && padding > kDecoderDelay ? padding - kDecoderDelay : 0;
        if (const int64_t stated = told - delay - padding; stated > decoded - before)
            m_options.warn(
                {"sonora2.CMpegDecoder.incomplete", "%s is incomplete: %.3f of %.3f seconds were found"},
                m_file.getDisplayName(), toSeconds(std::max<int64_t>(decoded - before, 0)),
                toSeconds(stated));
        if (before + behind <= decoded) {
            scan.start = before;
            scan.frames = decoded - before - behind;
        }
    }
    off_t* places = nullptr;
    size_t count = 0;
    if (mpg123_index(handle, &places, &scan.framesPerPlace, &count) != MPG123_OK) failToOpen();
    scan.places.assign(places, places + count);
    scan.identity = identify(m_input);
    m_scan = std::move(scan);
}

int CMpegDecoder::read(uint8_t* pcm, int frames) {
    size_t done = 0;
    // One MPEG frame at a time, so that none escapes checkContinuity().
    frames = std::min(frames, m_mpegFrames);
    const size_t wanted = static_cast<size_t>(frames) * static_cast<size_t>(m_format.frameBytes());
    int result = MPG123_NEW_FORMAT;
    // The format is announced once, before the first frame.
    for (int i = 0; i < 2 && result == MPG123_NEW_FORMAT && done == 0; ++i)
        result = mpg123_read(m_handle.get(), pcm, wanted, &done);
    if (result == MPG123_NEW_FORMAT && done == 0)
        fail({"sonora2.CMpegDecoder.change", "%s changes its format at %.3f seconds, which is not supported"},
             m_file.getDisplayName(), toSeconds(m_position));
    if (done == 0 && result != MPG123_OK && result != MPG123_DONE)
        fail({"sonora2.plugins.decode", "could not decode %s at %.3f seconds: %s"}, m_file.getDisplayName(),
             toSeconds(m_position), describe(mpg123_errcode(m_handle.get())));
    checkContinuity();
    int count = static_cast<int>(done / static_cast<size_t>(m_format.frameBytes()));
    if (count == 0 && m_position < m_scan.frames && m_scan.identity == identify(m_input)) {
        // Frames with an intact header may still be impossible to decode.
        if (!std::exchange(m_padding, true))
            m_options.warn({"sonora2.CMpegDecoder.undecodable",
                            "%s is damaged: %.3f seconds could not be decoded, silence follows the sound"},
                           m_file.getDisplayName(), toSeconds(m_scan.frames - m_position));
        count = static_cast<int>(std::min<int64_t>(frames, m_scan.frames - m_position));
        std::memset(pcm, 0, wanted);
    }
    m_position += count;
    return count;
}

// The codec silently skips what it does not recognise as a frame. Tags inside the sound are left by programs
// that join files.
void CMpegDecoder::checkContinuity() {
    mpg123_frameinfo info{};
    if (mpg123_info(m_handle.get(), &info) != MPG123_OK) return;
    const int64_t start = mpg123_framepos(m_handle.get());
    if (start < m_frameEnd) return; // still the same frame
    if (m_frameEnd > 0 && start > m_frameEnd && start > m_checkedUntil) {
        const int64_t skipped = start - skipTags(m_input.get(), m_frameEnd);
        seekInput(this, m_inputPosition, SEEK_SET);
        if (skipped > 0 && info.bitrate > 0)
            m_options.warn({"sonora2.CMpegDecoder.skipped",
                            "%s is damaged at %.3f seconds: %d bytes, about %.3f seconds, were skipped"},
                           m_file.getDisplayName(), toSeconds(m_position), skipped,
                           static_cast<double>(skipped) / (info.bitrate * 125.0));
    }
    m_frameEnd = start + info.framesize;
    m_checkedUntil = std::max(m_checkedUntil, start);
}

void CMpegDecoder::seek(int64_t frame) {
    if (mpg123_seek(m_handle.get(), m_scan.start + frame, SEEK_SET) < 0) {
        const P<peru::IString> reason = describe(mpg123_errcode(m_handle.get()));
        fail({"sonora2.plugins.seek", "could not find %.3f seconds in %s: %s"}, toSeconds(frame),
             m_file.getDisplayName(), reason);
    }
    m_position = frame;
    m_padding = false;
    m_frameEnd = 0;
}

std::unique_ptr<IDecoder> CMpegDecoder::createTwin() {
    auto twin = std::make_unique<CMpegDecoder>(m_file);
    twin->m_scan = m_scan;
    return twin;
}

P<peru::IString> CMpegDecoder::describe(int error) const {
    switch (error) {
    case MPG123_ERR_READER:
        if (m_input && std::ferror(m_input.get()))
            return peru::localize("sonora2.plugins.unreadable", "the file cannot be read");
        return peru::localize("sonora2.CMpegDecoder.noWholeFrame", "it ends before a whole frame");
    case MPG123_RESYNC_FAIL:
        return peru::localize("sonora2.CMpegDecoder.noFrame", "no MPEG audio frame was found");
    case MPG123_OUT_OF_MEM:
        return peru::localize("sonora2.CMpegDecoder.noMemory", "there is not enough memory");
    default:
        return peru::localize("sonora2.CMpegDecoder.decoderFailed", "the decoder failed");
    }
}

void CMpegDecoder::failToOpen() const {
    fail({"sonora2.plugins.open", "could not open %s: %s"}, m_file.getDisplayName(),
         describe(mpg123_errcode(m_handle.get())));
}

} // namespace sonora2::plugins

#include "support/ChunkProducer.h"

#include "sonora2/media/AudioChunk.h"

#include <algorithm>
#include <cstring>
#include <numeric>
#include <utility>

namespace sonora2::plugins {

namespace {

constexpr int kChunkFrames = 8192;
constexpr int kChunkBytes = 256 * 1024; // wide formats get fewer frames
// Frames of the file that fill the filter (16 samples on each side) before the first frame wanted after a
// seek. Conversions to a lower rate need proportionally more.
constexpr int64_t kRunUp = 64;
// Headers that claim more than this are damaged.
constexpr int kMaxRatio = 1024;
constexpr int kMaxRate = 1 << 20;

// More than any file holds, and small enough to be scaled.
constexpr int64_t kUnlimited = int64_t{1} << 40;

SDecodedMedia withoutEstimate(SDecodedMedia media) {
    if (media.isEstimate) media.frames = kUnlimited;
    return media;
}

// round(value * numerator / denominator) without overflow for the frame counts of any file that fits a disk.
int64_t scale(int64_t value, int64_t numerator, int64_t denominator) {
    const int64_t whole = value / denominator;
    const int64_t rest = value % denominator;
    return whole * numerator + (rest * numerator + denominator / 2) / denominator;
}

} // namespace

CChunkProducer::CChunkProducer(const P<common::ISonoraContext>& context, const SMediaFile& file,
                               IDecoder& decoder, const SDecodedMedia& media, const SPcmFormat& wanted,
                               const SDecoderOptions& options)
    : m_memory(context->getMemoryManager()), m_file(file), m_decoder(decoder), m_options(options),
      m_media(withoutEstimate(media)), m_wanted(wanted), m_total(countDelivered(m_media, wanted)),
      m_end(m_total), m_converting(!(media.format == wanted)) {
    m_chunkFrames = std::clamp(kChunkBytes / wanted.frameBytes(), 1, kChunkFrames);
    if (m_converting) {
        // Frames of the file that convert to about one delivered chunk.
        const int64_t own = scale(m_chunkFrames, media.format.rate, wanted.rate);
        m_ownChunkFrames = static_cast<int>(std::clamp<int64_t>(own, 64, kChunkFrames));
    }
}

void CChunkProducer::requireDeliverable(const SMediaFile& file, const SPcmFormat& own,
                                        const SPcmFormat& wanted) {
    if (own == wanted) return;
    const auto [low, high] = std::minmax(own.rate, wanted.rate);
    if (!CFormatConverter::canConvert(own.channels, wanted.channels))
        fail({"sonora2.CChunkProducer.channels",
              "%s has %d channels and cannot be converted to %d Hz, %d channels"},
             file.getDisplayName(), own.channels, wanted.rate, wanted.channels);
    if (high / low >= kMaxRatio || high > kMaxRate)
        fail({"sonora2.CChunkProducer.rate",
              "%s has a sample rate of %d Hz and cannot be converted to %d Hz, %d channels"},
             file.getDisplayName(), own.rate, wanted.rate, wanted.channels);
}

int64_t CChunkProducer::countDelivered(const SDecodedMedia& media, const SPcmFormat& wanted) {
    return scale(media.frames, wanted.rate, media.format.rate);
}

void CChunkProducer::seek(int64_t frame) {
    m_position = std::clamp<int64_t>(frame, 0, m_total);
    m_end = m_total;
    const bool wasEnded = std::exchange(m_ended, false);
    m_failure = nullptr;
    int64_t own = m_position;
    if (m_converting) {
        // The filter's phase repeats every `ownPeriod` frames. A new converter that starts at a multiple of
        // it delivers the same samples as an uninterrupted run once its filter is full.
        const int64_t common = std::gcd(m_media.format.rate, m_wanted.rate);
        const int64_t ownPeriod = m_media.format.rate / common;
        const int64_t runUp = kRunUp * (1 + m_media.format.rate / m_wanted.rate);
        const int64_t at = scale(m_position, m_media.format.rate, m_wanted.rate);
        own = std::max<int64_t>(0, at - runUp) / ownPeriod * ownPeriod;
        m_drop = m_position - own / ownPeriod * (m_wanted.rate / common);
        m_converter.reset();
        m_flushed = false;
    }
    if (own == m_read && !wasEnded) return;
    m_ended = true; // in case the seek fails
    m_decoder.seek(own);
    m_ended = false;
    m_read = own;
}

P<audio::IAudioChunk> CChunkProducer::next() {
    P<audio::IAudioChunk> chunk = m_converting ? nextConverted() : nextPlain();
    if (!chunk && m_failure) std::rethrow_exception(std::exchange(m_failure, nullptr));
    return chunk;
}

P<audio::IAudioChunk> CChunkProducer::nextPlain() {
    if (m_ended || m_position >= m_total) return nullptr;
    const int wanted = static_cast<int>(std::min<int64_t>(m_chunkFrames, m_total - m_position));
    const int64_t frameBytes = m_wanted.frameBytes();
    P<peru::IMemoryBlock> block = m_memory->getBlock(wanted * frameBytes);
    const int frames = readOwn(block->getData(), wanted);
    if (frames == 0) return nullptr;
    block->setSize(frames * frameBytes);
    return makeChunk(std::move(block), frames);
}

P<audio::IAudioChunk> CChunkProducer::nextConverted() {
    const int64_t frameBytes = m_wanted.frameBytes();
    if (!m_converter) m_converter.emplace(m_media.format, m_wanted, m_memory);
    const int ownFrameBytes = m_media.format.frameBytes();
    while (m_position < m_end) {
        P<peru::IMemoryBlock> block;
        if (m_flushed) return nullptr; // the silence after the end is used up
        P<peru::IMemoryBlock> own = m_memory->getBlock(int64_t{m_ownChunkFrames} * ownFrameBytes);
        const int64_t left = m_media.frames - m_read;
        const int frames =
            left > 0 && !m_ended
                ? readOwn(own->getData(), static_cast<int>(std::min<int64_t>(m_ownChunkFrames, left)))
                : 0;
        if (frames == 0) {
            m_flushed = true; // the filter still holds the last frames
            m_end = std::min(m_end, scale(m_read, m_wanted.rate, m_media.format.rate));
            if (m_position >= m_end) return nullptr;
            block = m_converter->convert(nullptr, 0);
        } else {
            block = m_converter->convert(own->getData(), frames);
        }
        int64_t count = block->getSize() / frameBytes;
        const int64_t dropped = std::min(count, m_drop);
        m_drop -= dropped;
        count = std::min(count - dropped, m_end - m_position);
        if (count == 0) continue;
        if (dropped > 0)
            std::memmove(block->getData(), block->getData() + dropped * frameBytes,
                         static_cast<size_t>(count * frameBytes));
        block->setSize(count * frameBytes);
        return makeChunk(std::move(block), count);
    }
    return nullptr;
}

int CChunkProducer::readOwn(uint8_t* pcm, int frames) {
    // A decoder may return fewer frames than requested; chunks are still filled unless the file ends.
    int filled = 0;
    const int frameBytes = m_media.format.frameBytes();
    try {
        while (filled < frames) {
            const int count = m_decoder.read(pcm + int64_t{filled} * frameBytes, frames - filled);
            if (count <= 0) {
                m_ended = true;
                if (!m_media.isEstimate) reportEarlyEnd();
                break;
            }
            filled += count;
            m_read += count;
        }
    } catch (...) {
        m_ended = true;
        m_failure = std::current_exception();
    }
    return filled;
}

// Only called when there are frames left.
void CChunkProducer::reportEarlyEnd() const {
    constexpr peru::SLocalizedText kText{"sonora2.CChunkProducer.earlyEnd",
                                         "%s ends after %.3f of %.3f seconds"};
    const double rate = m_media.format.rate;
    const double at = static_cast<double>(m_read) / rate;
    const double total = static_cast<double>(m_media.frames) / rate;
    if (!m_options.salvage) fail(kText, m_file.getDisplayName(), at, total);
    m_options.warn(kText, m_file.getDisplayName(), at, total);
}

P<audio::IAudioChunk> CChunkProducer::makeChunk(P<peru::IMemoryBlock> block, int64_t frames) {
    const double timestamp = static_cast<double>(m_position - m_origin) / m_wanted.rate;
    m_position += frames;
    return peru::make<audio::CAudioChunk>(timestamp, std::move(block));
}

} // namespace sonora2::plugins

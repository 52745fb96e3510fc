#include "sonora2_vorbis/VorbisDecoder.h"

#include "sonora2_vorbis/ChannelOrder.h"
#include "support/Pcm.h"

#include <algorithm>
#include <cstring>

namespace sonora2::plugins {

namespace {

constexpr int kBytesPerSample = 2;
constexpr int kMaxChannels = 8;
constexpr int kBlockFrames = 4096;
constexpr int kMaxResyncFrames = 1 << 20; // searched for a position after a gap

P<peru::IString> describe(long error) {
    switch (error) {
    case OV_EREAD:
        return peru::localize("sonora2.plugins.unreadable", "the file cannot be read");
    case OV_ENOTVORBIS:
        return peru::localize("sonora2.CVorbisDecoder.noStream", "there is no Vorbis stream in it");
    case OV_EVERSION:
        return peru::localize("sonora2.CVorbisDecoder.version", "its version of Vorbis is unknown");
    case OV_EBADHEADER:
        return peru::localize("sonora2.CVorbisDecoder.header", "its header is damaged");
    case OV_EBADLINK:
        return peru::localize("sonora2.CVorbisDecoder.isDamaged", "it is damaged");
    default:
        return peru::localize("sonora2.CVorbisDecoder.undecodable", "it cannot be decoded");
    }
}

} // namespace

SDecodedMedia CVorbisDecoder::open(const SDecoderOptions& options) {
    close();
    m_options = options;
    InputFile file = openForReading(m_file);
    if (const int error = ov_open_callbacks(file.get(), &m_stream, nullptr, 0, OV_CALLBACKS_DEFAULT);
        error < 0)
        fail({"sonora2.plugins.open", "could not open %s: %s"}, m_file.getDisplayName(), describe(error));
    static_cast<void>(file.release()); // now owned by the stream
    m_opened = true;

    const vorbis_info* info = ov_info(&m_stream, -1);
    const ogg_int64_t frames = ov_pcm_total(&m_stream, -1);
    if (!info || frames < 0)
        fail({"sonora2.plugins.open", "could not open %s: %s"}, m_file.getDisplayName(),
             describe(OV_EBADLINK));
    if (info->channels > kMaxChannels)
        fail({"sonora2.CVorbisDecoder.channels", "could not open %s: it has %d channels"},
             m_file.getDisplayName(), info->channels);
    m_format = {static_cast<int>(info->rate), info->channels, kBytesPerSample};
    // Streams may be chained, but chunks cannot express a change of format.
    for (int link = 0; link < ov_streams(&m_stream); ++link) {
        const vorbis_info* other = ov_info(&m_stream, link);
        if (other->rate != m_format.rate || other->channels != m_format.channels)
            fail({"sonora2.CVorbisDecoder.chain",
                  "could not open %s: it is a chain of streams in different formats"},
                 m_file.getDisplayName());
    }
    return {m_format, frames, "Vorbis"};
}

void CVorbisDecoder::close() {
    forget(0);
    if (!m_opened) return;
    ov_clear(&m_stream); // closes the file as well
    m_opened = false;
}

int CVorbisDecoder::read(uint8_t* pcm, int frames) {
    int count = 0;
    if (m_silence == 0 && m_restStart == m_rest.size()) count = decode(pcm, frames);
    const size_t frameBytes = static_cast<size_t>(m_format.frameBytes());
    if (m_silence > 0) {
        count = static_cast<int>(std::min<int64_t>(frames, m_silence));
        std::memset(pcm, 0, static_cast<size_t>(count) * frameBytes);
        m_silence -= count;
    } else if (m_restStart < m_rest.size()) {
        const size_t bytes = std::min(m_rest.size() - m_restStart, static_cast<size_t>(frames) * frameBytes);
        std::memcpy(pcm, m_rest.data() + m_restStart, bytes);
        m_restStart += bytes;
        count = static_cast<int>(bytes / frameBytes);
    }
    m_position += count;
    return count;
}

int CVorbisDecoder::decode(uint8_t* pcm, int frames) {
    const int count = decodeBlock(pcm, frames);
    if (count != OV_HOLE) return count;

    // Data was lost. How much is only known from the next page that states its position, and the frames up to
    // it follow the gap.
    std::vector<uint8_t> block(static_cast<size_t>(kBlockFrames) * m_format.frameBytes());
    m_rest.clear();
    m_restStart = 0;
    int64_t gap = 0;
    int64_t expected = m_position;
    while (gap == 0 && expected - m_position < kMaxResyncFrames) {
        const int got = decodeBlock(block.data(), kBlockFrames);
        if (got == OV_HOLE) continue;
        if (got == 0) break;
        expected += got;
        m_rest.insert(m_rest.end(), block.begin(), block.begin() + int64_t{got} * m_format.frameBytes());
        gap = std::max<int64_t>(ov_pcm_tell(&m_stream) - expected, 0);
    }
    if (gap > 0) skipGap(gap);
    return 0;
}

int CVorbisDecoder::decodeBlock(uint8_t* pcm, int frames) {
    float** planes = nullptr;
    int link = 0;
    const long got = ov_read_float(&m_stream, &planes, frames, &link);
    if (got == OV_HOLE) return OV_HOLE;
    if (got < 0)
        fail({"sonora2.plugins.decode", "could not decode %s at %.3f seconds: %s"}, m_file.getDisplayName(),
             static_cast<double>(m_position) / m_format.rate, describe(got));
    const float* ordered[kMaxChannels];
    const int* order = getVorbisChannelOrder(m_format.channels);
    for (int i = 0; got > 0 && i < m_format.channels; ++i) ordered[i] = planes[order ? order[i] : i];
    if (got > 0)
        pcm::packPlanesFloat(ordered, m_format.channels, pcm, kBytesPerSample, static_cast<size_t>(got));
    return static_cast<int>(got);
}

// Seeking to a page and decoding from there finds a gap before the frame, which a seek to the frame would
// hide.
void CVorbisDecoder::seek(int64_t frame) {
    forget(frame);
    if (const int error = ov_pcm_seek_page(&m_stream, frame); error < 0)
        fail({"sonora2.plugins.seek", "could not find %.3f seconds in %s: %s"},
             static_cast<double>(frame) / m_format.rate, m_file.getDisplayName(), describe(error));
    const int64_t found = ov_pcm_tell(&m_stream);
    if (found > frame) return skipGap(found - frame);
    m_position = found;
    std::vector<uint8_t> dropped(static_cast<size_t>(kBlockFrames) * m_format.frameBytes());
    while (m_position < frame)
        if (read(dropped.data(), static_cast<int>(std::min<int64_t>(frame - m_position, kBlockFrames))) == 0)
            return;
}

void CVorbisDecoder::skipGap(int64_t frames) {
    const double from = static_cast<double>(m_position) / m_format.rate;
    const double length = static_cast<double>(frames) / m_format.rate;
    if (!m_options.salvage)
        fail({"sonora2.CVorbisDecoder.damaged",
              "%s is damaged at %.3f seconds: %.3f seconds of sound are missing"},
             m_file.getDisplayName(), from, length);
    m_silence = frames;
    m_options.warn(
        {"sonora2.plugins.replaced", "%s is damaged: %.3f to %.3f seconds were replaced by silence"},
        m_file.getDisplayName(), from, from + length);
}

void CVorbisDecoder::forget(int64_t position) {
    m_position = position;
    m_silence = 0;
    m_rest.clear();
    m_restStart = 0;
}

} // namespace sonora2::plugins

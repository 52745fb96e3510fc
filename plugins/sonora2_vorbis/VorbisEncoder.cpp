#include "sonora2_vorbis/VorbisEncoder.h"

#include "sonora2_vorbis/ChannelOrder.h"
#include "support/BitRate.h"
#include "support/Pcm.h"

#include <algorithm>
#include <iterator>
#include <random>
#include <vorbis/vorbisenc.h>

namespace sonora2::plugins {

namespace {

constexpr double kDefaultQuality = 0.3;
constexpr int kMaxChannels = 8;
constexpr int kMaxRate = 200000;
// The codec moves its pending input with every block, so large writes cost quadratic time. The codec's own
// program writes this many frames at once; doing the same yields the same first block.
constexpr int kFramesAtOnce = 1024;

int orOpen(int bitRate) {
    return bitRate > 0 ? bitRate : -1;
}

bool hasMode(const SPcmFormat& format, int bitRate) {
    vorbis_info info;
    vorbis_info_init(&info);
    // Only chooses the mode: the codec's set-up of some modes allocates memory that it never frees.
    const bool found = vorbis_encode_setup_managed(&info, format.channels, format.rate, -1, bitRate, -1) == 0;
    vorbis_info_clear(&info);
    return found;
}

// Found by trial, to 100 bit/s: the codec cannot be asked. The modes of a format cover a single range, which
// contains the bit rate of every quality. 0 to 0 if there is no mode.
SBitRateRange findBitRates(const SPcmFormat& format) {
    constexpr int kStep = 100, kMost = 20'000'000 / kStep;
    int inside = 1;
    while (inside < kMost && !hasMode(format, inside * kStep)) inside += inside / 4 + 1;
    if (inside >= kMost) return {0, 0};
    const auto find = [&](int accepted, int refused) {
        while (std::abs(accepted - refused) > 1) {
            const int middle = (accepted + refused) / 2;
            (hasMode(format, middle * kStep) ? accepted : refused) = middle;
        }
        return accepted * kStep;
    };
    return {find(inside, 0), find(inside, kMost)};
}

} // namespace

CVorbisEncoder::CVorbisEncoder() {
    vorbis_info_init(&m_info);
    vorbis_comment_init(&m_comment);
}

CVorbisEncoder::~CVorbisEncoder() {
    ogg_stream_clear(&m_stream);
    vorbis_block_clear(&m_block);
    vorbis_dsp_clear(&m_state);
    vorbis_comment_clear(&m_comment);
    vorbis_info_clear(&m_info);
}

bool CVorbisEncoder::accepts(const SPcmFormat& format) const {
    if (format.channels <= kMaxChannels && format.rate <= kMaxRate) return true;
    fail({"sonora2.CVorbisEncoder.formats",
          "Ogg Vorbis files hold 1 to %d channels at up to %d Hz, not %d channels at %d Hz"},
         kMaxChannels, kMaxRate, format.channels, format.rate);
}

void CVorbisEncoder::open(COutputFile& file, const SEncoderSettings& settings) {
    m_file = &file;
    m_format = settings.format;
    const bool byBitRate = settings.nominalBitRate > 0 || settings.minBitRate > 0 || settings.maxBitRate > 0;
    const int error =
        byBitRate ? vorbis_encode_init(&m_info, m_format.channels, m_format.rate, orOpen(settings.maxBitRate),
                                       orOpen(settings.nominalBitRate), orOpen(settings.minBitRate))
                  : vorbis_encode_init_vbr(&m_info, m_format.channels, m_format.rate,
                                           static_cast<float>(settings.quality.value_or(kDefaultQuality)));
    if (error != 0 && byBitRate) {
        const SBitRateRange range = findBitRates(m_format);
        for (const int bitRate : {settings.nominalBitRate, settings.maxBitRate, settings.minBitRate})
            if (range.highest > 0) requireBitRate(file.getFile(), "Vorbis", m_format, bitRate, range);
    }
    if (error != 0)
        fail({"sonora2.CVorbisEncoder.noMode", "could not write %s: Vorbis has no mode for %d channels at %d "
                                               "Hz with a bit rate of %d (at least %d, at most %d)"},
             file.getFile().getDisplayName(), m_format.channels, m_format.rate, settings.nominalBitRate,
             settings.minBitRate, settings.maxBitRate);
    vorbis_analysis_init(&m_state, &m_info);
    vorbis_block_init(&m_state, &m_block);
    // The serial number distinguishes streams that are chained later.
    ogg_stream_init(&m_stream, static_cast<int>(std::random_device{}()));
    writeHeaders();
}

void CVorbisEncoder::writeHeaders() {
    ogg_packet identification, comment, setup;
    vorbis_analysis_headerout(&m_state, &m_comment, &identification, &comment, &setup);
    ogg_stream_packetin(&m_stream, &identification);
    ogg_stream_packetin(&m_stream, &comment);
    ogg_stream_packetin(&m_stream, &setup);
    ogg_page page;
    while (ogg_stream_flush(&m_stream, &page)) writePage(page); // audio must begin on a new page
}

void CVorbisEncoder::write(const uint8_t* pcm, int frames) {
    const int* order = getVorbisChannelOrder(m_format.channels);
    while (frames > 0) { // writing 0 frames would end the stream
        const int count = std::min(frames, kFramesAtOnce);
        float** planes = vorbis_analysis_buffer(&m_state, count);
        for (int i = 0; i < m_format.channels; ++i)
            pcm::unpackChannelFloat(pcm + i * m_format.bytesPerSample, m_format.bytesPerSample,
                                    m_format.channels, planes[order ? order[i] : i],
                                    static_cast<size_t>(count));
        vorbis_analysis_wrote(&m_state, count);
        encodeBlocks();
        pcm += int64_t{count} * m_format.frameBytes();
        frames -= count;
    }
}

void CVorbisEncoder::finish() {
    vorbis_analysis_wrote(&m_state, 0);
    encodeBlocks();
}

void CVorbisEncoder::encodeBlocks() {
    while (vorbis_analysis_blockout(&m_state, &m_block) == 1) {
        vorbis_analysis(&m_block, nullptr);
        vorbis_bitrate_addblock(&m_block);
        ogg_packet packet;
        while (vorbis_bitrate_flushpacket(&m_state, &packet)) {
            ogg_stream_packetin(&m_stream, &packet);
            ogg_page page;
            while (ogg_stream_pageout(&m_stream, &page)) writePage(page);
        }
    }
}

void CVorbisEncoder::writePage(const ogg_page& page) {
    m_file->write(page.header, static_cast<size_t>(page.header_len));
    m_file->write(page.body, static_cast<size_t>(page.body_len));
}

int64_t CVorbisEncoder::estimateBytes(double seconds, const SEncoderSettings& settings) const {
    if (settings.nominalBitRate > 0) return static_cast<int64_t>(seconds * settings.nominalBitRate / 8);
    // The encoder's target bit rates for stereo at 44.1 kHz by tenths of quality, in kbit/s.
    static constexpr double kBitRates[] = {64, 80, 96, 112, 128, 160, 192, 224, 256, 320, 500};
    const double tenths = settings.quality.value_or(kDefaultQuality) * 10;
    const int below = std::min(static_cast<int>(tenths), static_cast<int>(std::size(kBitRates)) - 2);
    const double bitRate = kBitRates[below] + (tenths - below) * (kBitRates[below + 1] - kBitRates[below]);
    const double samples = static_cast<double>(settings.format.rate) * settings.format.channels;
    return static_cast<int64_t>(seconds * bitRate * 1000 / 8 * samples / (44100.0 * 2));
}

} // namespace sonora2::plugins

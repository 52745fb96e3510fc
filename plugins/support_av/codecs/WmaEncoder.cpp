#include "codecs/WmaEncoder.h"

#include "codecs/AvErrors.h"
#include "support/BitRate.h"
#include "support/Pcm.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <new>

namespace sonora2::plugins::av {

namespace {

constexpr int kMaxChannels = 2;
constexpr SBitRateRange kRates{8000, 48000};
constexpr SBitRateRange kBitRates{24000, 320000};
constexpr int kBufferBytes = 64 * 1024;
constexpr double kOverhead = 1.03; // of the container

int chooseBitRate(const SEncoderSettings& settings) {
    for (const int bitRate : {settings.nominalBitRate, settings.maxBitRate, settings.minBitRate})
        if (bitRate > 0) return bitRate;
    if (!settings.quality) return 160000;
    return static_cast<int>(std::lround(64.0 + *settings.quality * (320 - 64))) * 1000;
}

} // namespace

CWmaEncoder::~CWmaEncoder() {
    avformat_free_context(m_container);
}

bool CWmaEncoder::accepts(const SPcmFormat& format) const {
    if (format.channels <= kMaxChannels && kRates.contains(format.rate)) return true;
    fail({"sonora2.CWmaEncoder.format",
          "WMA files hold 1 or 2 channels at %d to %d Hz, not %d channels at %d Hz"},
         kRates.lowest, kRates.highest, format.channels, format.rate);
}

int CWmaEncoder::writeBytes(void* self, uint8_t* bytes, int size) {
    COutputFile& file = *static_cast<CWmaEncoder*>(self)->m_file;
    return file.tryWrite(bytes, static_cast<size_t>(size)) ? size : AVERROR(EIO);
}

int64_t CWmaEncoder::seekBytes(void* self, int64_t offset, int whence) {
    COutputFile& file = *static_cast<CWmaEncoder*>(self)->m_file;
    if (whence & AVSEEK_SIZE) return file.getSize();
    if ((whence & ~AVSEEK_FORCE) != SEEK_SET) return AVERROR(EINVAL);
    return file.trySeek(offset) ? offset : AVERROR(EIO);
}

void CWmaEncoder::check(int result) const {
    m_file->throwFailure(); // the reason, where the file could not be written
    if (result < 0) failToWrite(m_file->getFile(), describe(result));
}

void CWmaEncoder::open(COutputFile& file, const SEncoderSettings& settings) {
    m_file = &file;
    m_format = settings.format;
    const int bitRate = chooseBitRate(settings);
    requireBitRate(file.getFile(), "WMA", m_format, bitRate, kBitRates);

    const AVCodec* const encoder = avcodec_find_encoder(AV_CODEC_ID_WMAV2);
    m_codec.reset(avcodec_alloc_context3(encoder));
    m_frame.reset(av_frame_alloc());
    m_packet.reset(av_packet_alloc());
    auto* const buffer = static_cast<uint8_t*>(av_malloc(kBufferBytes));
    if (buffer)
        m_io.reset(avio_alloc_context(buffer, kBufferBytes, 1, this, nullptr, &writeBytes, &seekBytes));
    if (!m_codec || !m_frame || !m_packet || !m_io) throw std::bad_alloc();
    if (!encoder) check(AVERROR_ENCODER_NOT_FOUND);
    m_codec->sample_rate = m_format.rate;
    m_codec->sample_fmt = AV_SAMPLE_FMT_FLTP;
    m_codec->bit_rate = bitRate;
    m_codec->time_base = {1, m_format.rate};
    m_codec->flags |= AV_CODEC_FLAG_GLOBAL_HEADER;
    av_channel_layout_default(&m_codec->ch_layout, m_format.channels);
    check(avcodec_open2(m_codec.get(), encoder, nullptr));

    m_frame->format = AV_SAMPLE_FMT_FLTP;
    m_frame->nb_samples = m_codec->frame_size;
    m_frame->sample_rate = m_format.rate;
    check(av_channel_layout_copy(&m_frame->ch_layout, &m_codec->ch_layout));
    check(av_frame_get_buffer(m_frame.get(), 0));

    check(avformat_alloc_output_context2(&m_container, nullptr, "asf", nullptr));
    m_container->pb = m_io.get();
    m_container->flags |= AVFMT_FLAG_BITEXACT; // no name of a program in the file
    AVStream* const stream = avformat_new_stream(m_container, nullptr);
    if (!stream) throw std::bad_alloc();
    stream->time_base = m_codec->time_base;
    check(avcodec_parameters_from_context(stream->codecpar, m_codec.get()));
    check(avformat_write_header(m_container, nullptr));
    // Decoders drop two blocks at the start, of which the codec adds one.
    sendBlock();
}

void CWmaEncoder::write(const uint8_t* pcm, int frames) {
    while (frames > 0) {
        const int count = std::min(frames, m_codec->frame_size - m_filled);
        for (int i = 0; i < m_format.channels; ++i)
            pcm::unpackChannelFloat(
                pcm + i * m_format.bytesPerSample, m_format.bytesPerSample, m_format.channels,
                reinterpret_cast<float*>(m_frame->extended_data[i]) + m_filled, static_cast<size_t>(count));
        m_filled += count;
        if (m_filled == m_codec->frame_size) sendBlock();
        pcm += int64_t{count} * m_format.frameBytes();
        frames -= count;
    }
}

void CWmaEncoder::sendBlock() {
    for (int i = 0; i < m_format.channels; ++i)
        std::fill(reinterpret_cast<float*>(m_frame->extended_data[i]) + m_filled,
                  reinterpret_cast<float*>(m_frame->extended_data[i]) + m_codec->frame_size, 0.0f);
    m_frame->pts = m_written;
    m_written += m_codec->frame_size;
    m_filled = 0;
    encode(m_frame.get());
    check(av_frame_make_writable(m_frame.get()));
}

void CWmaEncoder::encode(AVFrame* frame) {
    check(avcodec_send_frame(m_codec.get(), frame));
    for (;;) {
        const int result = avcodec_receive_packet(m_codec.get(), m_packet.get());
        if (result == AVERROR(EAGAIN) || result == AVERROR_EOF) return;
        check(result);
        av_packet_rescale_ts(m_packet.get(), m_codec->time_base, m_container->streams[0]->time_base);
        m_packet->stream_index = 0;
        check(av_write_frame(m_container, m_packet.get()));
        av_packet_unref(m_packet.get());
    }
}

void CWmaEncoder::update() {
    avio_flush(m_io.get());
}

void CWmaEncoder::finish() {
    if (m_filled > 0 || m_written == m_codec->frame_size) sendBlock();
    encode(nullptr);
    check(av_write_trailer(m_container));
    avio_flush(m_io.get());
    check(m_io->error);
}

int64_t CWmaEncoder::estimateBytes(double seconds, const SEncoderSettings& settings) const {
    return static_cast<int64_t>(seconds * chooseBitRate(settings) / 8 * kOverhead);
}

} // namespace sonora2::plugins::av

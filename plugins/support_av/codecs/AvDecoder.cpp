#include "codecs/AvDecoder.h"

#include "codecs/AvErrors.h"
#include "codecs/AvLog.h"
#include "codecs/Mp4Length.h"
#include "peru/strings/IStringLocalizer.h"
#include "support/Pcm.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <new>
#include <string_view>
#include <utility>

namespace sonora2::plugins::av {

namespace {

constexpr int kMaxChannels = 64;
constexpr int kMaxSilence = 10;      // seconds for a damaged packet
constexpr int kTolerated = 32;       // packets at a start that refer to what precedes them
constexpr double kMissing = 0.25;    // seconds by which containers misstate the length
constexpr int kUncertainPackets = 4; // packets by which they do

bool isLossless(const AVCodecContext& codec) {
    const AVCodecDescriptor* const descriptor = avcodec_descriptor_get(codec.codec_id);
    if (!descriptor || !(descriptor->props & AV_CODEC_PROP_LOSSLESS)) return false;
    // Codecs with a lossless extension decode to integers with it and to floating point without.
    const AVSampleFormat format = av_get_packed_sample_fmt(codec.sample_fmt);
    return !(descriptor->props & AV_CODEC_PROP_LOSSY) || codec.codec_id == AV_CODEC_ID_WAVPACK ||
           format == AV_SAMPLE_FMT_S16 || format == AV_SAMPLE_FMT_S32;
}

// Bytes of an integer sample as delivered.
int getWidth(const AVCodecContext& codec) {
    if (!isLossless(codec)) return 2;
    const int bits = codec.bits_per_raw_sample;
    switch (av_get_packed_sample_fmt(codec.sample_fmt)) {
    case AV_SAMPLE_FMT_U8:
        return 1;
    case AV_SAMPLE_FMT_S16:
        return 2;
    case AV_SAMPLE_FMT_S32:
        return bits > 0 && bits <= 24 ? 3 : 4;
    default:
        return 4;
    }
}

int getFloatWidth(const AVCodecContext& codec) {
    if (!isLossless(codec)) return 0;
    const AVSampleFormat format = av_get_packed_sample_fmt(codec.sample_fmt);
    return format == AV_SAMPLE_FMT_FLT ? 4 : format == AV_SAMPLE_FMT_DBL ? 8 : 0;
}

// The number of frames that iTunes-compatible encoders store as a comment; 0 if there is none.
int64_t getStatedFrames(const AVFormatContext& format) {
    const AVDictionaryEntry* const entry = av_dict_get(format.metadata, "iTunSMPB", nullptr, 0);
    unsigned long long frames = 0;
    if (!entry || std::sscanf(entry->value, "%*x %*x %*x %llx", &frames) != 1) return 0;
    return frames < (1ull << 40) ? static_cast<int64_t>(frames) : 0;
}

bool isMp4(const AVFormatContext& format) {
    return std::string_view(format.iformat->name).find("mp4") != std::string_view::npos;
}

} // namespace

SDecodedMedia CAvDecoder::open(const SDecoderOptions& options) {
    close();
    m_options = options;
    const CAvLog log(m_options.log);
    m_isFloat = m_hasScanned = false;
    m_packets = {};
    m_format = {};
    start();
    m_soundtracks = m_demuxer->getSoundtracks();
    if (!readFrame()) failToOpen(m_file, peru::localize("sonora2.av.NoSound", "there is no sound in it"));
    chooseFormat();
    m_firstTime = m_frame->pts;
    m_firstCount = m_frame->nb_samples;
    if (m_lostAtStart > 0) {
        silence(m_lostAtStart);
        m_firstTime = AV_NOPTS_VALUE; // not the time of frame 0
    }
    convertFrame();
    m_packetFrames = 0;
    try {
        if (readFrame()) {
            // Codecs with packets of varying length state no frame size.
            if (m_codec->frame_size > 0 || m_codec->codec_id == AV_CODEC_ID_OPUS)
                m_packetFrames = m_frame->nb_samples;
            convertFrame();
        }
    } catch (...) {
        m_damage = std::current_exception(); // to be thrown after the first frame
    }
    estimateLength();
    SDecodedMedia media{m_format, m_estimate, m_codecName};
    media.floatBytes = m_floatBytes;
    media.isEstimate = true;
    return media;
}

void CAvDecoder::close() {
    m_codec.reset();
    m_demuxer.reset();
    m_converter.reset();
    m_pending.clear();
    m_pendingStart = 0;
}

void CAvDecoder::selectSoundtrack(int index) {
    m_soundtrack = index;
}

void CAvDecoder::start() {
    if (m_demuxer && m_demuxer->isPipe())
        failToOpen(m_file, peru::localize("sonora2.av.OnlyOnce", "a stream can be read only once"));
    m_demuxer = std::make_unique<CDemuxer>(m_file, AVMEDIA_TYPE_AUDIO, m_soundtrack);
    m_packet.reset(av_packet_alloc());
    m_frame.reset(av_frame_alloc());
    if (!m_packet || !m_frame) throw std::bad_alloc();
    openCodec();
    m_pending.clear();
    m_pendingStart = 0;
    m_position = 0;
    m_hasDecoded = m_flushed = m_mustRestart = false;
    m_failures = 0;
    m_lostAtStart = 0;
    m_damage = nullptr;
}

void CAvDecoder::openCodec() {
    m_codec = m_demuxer->createCodec();
    const AVCodecDescriptor* const descriptor = avcodec_descriptor_get(m_codec->codec_id);
    if (descriptor && (descriptor->props & AV_CODEC_PROP_LOSSLESS))
        m_codec->err_recognition = AV_EF_CRCCHECK | AV_EF_EXPLODE;
    m_codec->thread_count = 1;
    if (const int error = avcodec_open2(m_codec.get(), nullptr, nullptr); error < 0)
        failToOpen(m_file, describe(error));
    m_codecName = descriptor && descriptor->long_name ? descriptor->long_name : m_codec->codec->name;
    // "AAC (Advanced Audio Coding)"
    if (const size_t end = m_codecName.find(" ("); end != std::string::npos && end > 0)
        m_codecName.resize(end);
}

void CAvDecoder::chooseFormat() {
    const int channels = m_frame->ch_layout.nb_channels;
    if (channels < 1 || channels > kMaxChannels || m_frame->sample_rate < 1)
        failToOpen(m_file, peru::localize("sonora2.av.NoSoundFormat",
                                          "%CHANNELS% channels at %RATE% Hz are not supported",
                                          {{"%CHANNELS%", peru::format("%d", channels)},
                                           {"%RATE%", peru::format("%d", m_frame->sample_rate)}}));
    m_format = {m_frame->sample_rate, channels, getWidth(*m_codec)};
    m_floatBytes = getFloatWidth(*m_codec);
}

void CAvDecoder::estimateLength() {
    const AVFormatContext& format = m_demuxer->getFormat();
    const AVStream& stream = m_demuxer->getStream();
    const double duration = m_demuxer->getDuration();
    m_estimate = duration > 0 ? std::llround(std::min(duration, 1e8) * m_format.rate) : 0;
    m_stated = m_statedEnd = 0;
    m_hasExactEnd = false;
    if (m_demuxer->isPipe()) {
        m_estimate = countPending(); // until the end is reached
        return;
    }
    if (format.duration_estimation_method == AVFMT_DURATION_FROM_BITRATE || duration < 0) {
        scanPackets();
        if (m_packets.frames > 0) m_estimate = m_packets.frames;
    } else if (stream.duration > 0 || format.nb_streams == 1) {
        m_stated = m_estimate;
    }
    m_isMp4 = isMp4(format) && isExact(stream.time_base);
    if (m_isMp4) findStatedEnd();
    m_estimate = std::max(m_estimate, countPending());
}

// In this order: a comment, the media's own duration if the edit list agrees, the edit list.
void CAvDecoder::findStatedEnd() {
    AVStream& stream = m_demuxer->getStream();
    const AVRational frames{1, m_format.rate};
    m_statedEnd = getStatedFrames(m_demuxer->getFormat());
    m_hasExactEnd = m_statedEnd > 0;
    const AVIndexEntry* const first = avformat_index_get_entry(&stream, 0);
    if (!m_hasExactEnd && first && m_stated > 0 && m_firstTime != AV_NOPTS_VALUE) {
        const int64_t duration = readMediaDuration(openForReading(m_file).get(), stream.index);
        const int64_t end = av_rescale_q(duration + first->timestamp - m_firstTime, stream.time_base, frames);
        m_hasExactEnd = duration > 0 && std::abs(end - m_stated) <= m_format.rate / 1000 + 1;
        m_statedEnd = m_hasExactEnd ? end : m_stated;
    }
    if (m_statedEnd > 0) m_estimate = m_statedEnd;
}

// Files without a length and without timestamps: AAC, AC-3 and other plain streams.
void CAvDecoder::scanPackets() {
    m_hasScanned = true;
    CDemuxer scanned(m_file, AVMEDIA_TYPE_AUDIO, m_soundtrack);
    int64_t duration = 0, sum = 0;
    bool isUniform = m_packetFrames > 0 && m_firstCount == m_packetFrames;
    while (scanned.read(*m_packet)) {
        if (m_packets.places.empty()) duration = m_packet->duration;
        isUniform = isUniform && m_packet->duration == duration && m_packet->pos >= 0;
        sum += m_packet->duration;
        m_packets.places.push_back(m_packet->pos);
        av_packet_unref(m_packet.get());
    }
    m_packets.frames = av_rescale_q(sum, scanned.getStream().time_base, {1, m_format.rate});
    if (isUniform) {
        m_packets.framesPerPacket = m_packetFrames;
        m_packets.frames = static_cast<int64_t>(m_packets.places.size()) * m_packetFrames;
    } else {
        m_packets.places = {};
    }
}

bool CAvDecoder::readFrame() {
    m_hasSilenced = false;
    for (;;) {
        const int result = avcodec_receive_frame(m_codec.get(), m_frame.get());
        if (result >= 0 && m_frame->nb_samples > 0) {
            m_hasDecoded = true;
            if (m_damage) std::rethrow_exception(std::exchange(m_damage, nullptr));
            return true;
        }
        if (result == AVERROR_EOF || (result == AVERROR(EAGAIN) && !sendPacket())) break;
        if (result < 0 && result != AVERROR(EAGAIN)) handleDamage(result);
        if (m_hasSilenced) return false;
    }
    // A file that was cut off ends with a damaged packet.
    if (m_damage && !m_hasDecoded) std::rethrow_exception(std::exchange(m_damage, nullptr));
    if (m_damage)
        m_options.warn("%s", peru::localize("sonora2.av.DamagedEnd", "%FILE% is damaged at its end",
                                            {{"%FILE%", m_file.getDisplayName()}}));
    m_damage = nullptr;
    return false;
}

// False when there is nothing left to send.
bool CAvDecoder::sendPacket() {
    if (m_flushed) return false;
    if (!m_demuxer->read(*m_packet)) {
        m_flushed = true;
        return avcodec_send_packet(m_codec.get(), nullptr) >= 0;
    }
    m_place = m_packet->pos;
    m_packetDuration = av_rescale_q(m_packet->duration, m_demuxer->getStream().time_base,
                                    {1, std::max(m_codec->sample_rate, 1)});
    const int result = avcodec_send_packet(m_codec.get(), m_packet.get());
    av_packet_unref(m_packet.get());
    if (result < 0 && result != AVERROR(EAGAIN)) handleDamage(result);
    return true;
}

void CAvDecoder::handleDamage(int error) {
    if (error == AVERROR(ENOMEM)) throw std::bad_alloc();
    if (!m_hasDecoded && !isLossless(*m_codec)) {
        // Packets at a start may refer to others that precede them.
        if (++m_failures > kTolerated) failAt(m_file, toSeconds(m_position), describe(error));
        return;
    }
    const double at = toSeconds(m_position + countPending());
    if (!m_options.salvage) {
        try {
            failAt(m_file, at, describe(error));
        } catch (...) {
            if (!m_damage) m_damage = std::current_exception();
        }
        return;
    }
    const int64_t lost =
        std::clamp<int64_t>(m_packetDuration, 0, int64_t{kMaxSilence} * m_codec->sample_rate);
    if (m_format.rate == 0) {
        m_lostAtStart += lost; // the width of a sample is not known yet
        return;
    }
    silence(lost);
}

void CAvDecoder::silence(int64_t frames) {
    const double at = toSeconds(m_position + countPending());
    m_hasSilenced = frames > 0;
    const uint8_t silent = m_format.bytesPerSample == 1 ? 128 : 0;
    m_pending.insert(m_pending.end(), static_cast<size_t>(frames * m_format.frameBytes()), silent);
    m_options.warn("%s", peru::localize("sonora2.av.Silenced",
                                        "%FILE% is damaged: %FROM% to %TO% seconds were replaced by silence",
                                        {{"%FILE%", m_file.getDisplayName()},
                                         {"%FROM%", peru::format("%.3f", at)},
                                         {"%TO%", peru::format("%.3f", at + toSeconds(frames))}}));
}

void CAvDecoder::prepareConverter() {
    AVChannelLayout in = {}, out = {};
    if (m_frame->ch_layout.order == AV_CHANNEL_ORDER_UNSPEC)
        av_channel_layout_default(&in, m_frame->ch_layout.nb_channels);
    else
        av_channel_layout_copy(&in, &m_frame->ch_layout);
    if (in.nb_channels == m_format.channels)
        av_channel_layout_copy(&out, &in);
    else
        av_channel_layout_default(&out, m_format.channels);
    const AVSampleFormat format = m_isFloat
                                      ? (m_format.bytesPerSample == 8 ? AV_SAMPLE_FMT_DBL : AV_SAMPLE_FMT_FLT)
                                  : m_format.bytesPerSample == 1 ? AV_SAMPLE_FMT_U8
                                  : m_format.bytesPerSample == 2 ? AV_SAMPLE_FMT_S16
                                                                 : AV_SAMPLE_FMT_S32;
    SwrContext* converter = nullptr;
    int result = swr_alloc_set_opts2(&converter, &out, format, m_format.rate, &in,
                                     static_cast<AVSampleFormat>(m_frame->format), m_format.rate, 0, nullptr);
    m_converter.reset(converter);
    if (result >= 0) result = swr_init(converter);
    av_channel_layout_uninit(&in);
    av_channel_layout_uninit(&out);
    if (result < 0) failAt(m_file, toSeconds(m_position), describe(result));
    m_convertedFrom = static_cast<AVSampleFormat>(m_frame->format);
    m_convertedChannels = m_frame->ch_layout.nb_channels;
}

// The last packet of an MPEG-4 file has more frames than there is sound.
int CAvDecoder::countUsedFrames() const {
    const int frames = m_frame->nb_samples;
    if (!m_isMp4) return frames;
    if (m_statedEnd > 0) {
        const int64_t at = m_position + countPending();
        const int limit = static_cast<int>(std::clamp<int64_t>(m_statedEnd - at, 0, frames));
        const int slack = m_hasExactEnd ? 0 : m_format.rate / 1000 + 1;
        return limit + slack >= frames ? frames : limit;
    }
    // A file of fragments says it packet by packet.
    const AVRational timeBase = m_demuxer->getStream().time_base;
    const int64_t own = av_rescale_q(m_frame->pkt_duration, timeBase, {1, m_format.rate});
    return own > 0 && own < frames ? static_cast<int>(own) : frames;
}

void CAvDecoder::convertFrame() {
    if (m_frame->sample_rate != m_format.rate)
        failAt(m_file, toSeconds(m_position + countPending()),
               peru::localize("sonora2.av.RateChanges", "the sample rate changes, which is not supported"));
    if (!m_converter || m_convertedFrom != m_frame->format ||
        m_convertedChannels != m_frame->ch_layout.nb_channels)
        prepareConverter();
    const int frames = countUsedFrames();
    if (frames == 0) return;
    const size_t samples = static_cast<size_t>(frames) * static_cast<size_t>(m_format.channels);
    const bool isPacked = m_format.bytesPerSample == 3; // from 32 bits
    const size_t bytes = samples * static_cast<size_t>(isPacked ? 4 : m_format.bytesPerSample);
    if (m_pendingStart == m_pending.size()) {
        m_pending.clear();
        m_pendingStart = 0;
    }
    const size_t at = m_pending.size();
    m_pending.resize(at + bytes);
    uint8_t* to = m_pending.data() + at;
    const int converted = swr_convert(m_converter.get(), &to, frames,
                                      const_cast<const uint8_t**>(m_frame->extended_data), frames);
    if (converted != frames) failAt(m_file, toSeconds(m_position), describe(std::min(converted, -1)));
    if (!isPacked) return;
    for (size_t i = 0; i < samples; ++i) std::memmove(to + 3 * i, to + 4 * i + 1, 3);
    m_pending.resize(at + samples * 3);
}

bool CAvDecoder::isExact(AVRational timeBase) const {
    const int64_t framesPerTick = int64_t{timeBase.num} * m_format.rate;
    return framesPerTick > 0 && timeBase.den % framesPerTick == 0;
}

double CAvDecoder::toSeconds(int64_t frame) const {
    return m_format.rate > 0 ? static_cast<double>(frame) / m_format.rate : 0.0;
}

int64_t CAvDecoder::countPending() const {
    return m_format.channels > 0
               ? static_cast<int64_t>(m_pending.size() - m_pendingStart) / m_format.frameBytes()
               : 0;
}

int CAvDecoder::read(uint8_t* pcm, int frames) {
    const CAvLog log(m_options.log);
    while (frames > 0 && countPending() == 0) {
        if (readFrame()) {
            convertFrame();
        } else if (countPending() == 0) {
            requireComplete();
            frames = 0;
        }
    }
    const int64_t count = std::min<int64_t>(frames, countPending());
    const size_t bytes = static_cast<size_t>(count * m_format.frameBytes());
    if (count > 0) std::memcpy(pcm, m_pending.data() + m_pendingStart, bytes);
    m_pendingStart += bytes;
    m_position += count;
    return static_cast<int>(count);
}

void CAvDecoder::requireComplete() {
    const int64_t tolerance =
        std::llround(kMissing * m_format.rate) + int64_t{kUncertainPackets} * std::max(m_packetFrames, 0);
    if (m_stated <= m_position + tolerance) return;
    const P<peru::IString> text =
        peru::localize("sonora2.av.EndsEarly", "%FILE% ends after %TIME% of %TOTAL% seconds",
                       {{"%FILE%", m_file.getDisplayName()},
                        {"%TIME%", peru::format("%.3f", toSeconds(m_position))},
                        {"%TOTAL%", peru::format("%.3f", toSeconds(m_stated))}});
    if (!m_options.salvage) throw common::CSonoraError(text);
    m_options.warn("%s", text);
}

void CAvDecoder::deliverFloat() {
    m_isFloat = true;
    m_format.bytesPerSample = m_floatBytes;
    m_mustRestart = true;
    m_converter.reset();
}

} // namespace sonora2::plugins::av

// How a decoder gets to an exact frame.
#include "codecs/AvDecoder.h"
#include "codecs/AvLog.h"

#include <algorithm>
#include <cmath>

namespace sonora2::plugins::av {

namespace {

constexpr double kPreroll = 0.25; // seconds that a lossy codec needs to settle after a seek
constexpr double kNearby = 2.0;   // seconds that are decoded rather than skipped

// Whether a decoder can start at any packet and soon delivers the same samples, at the time of that packet.
bool canStartAnywhere(AVCodecID codec) {
    return codec != AV_CODEC_ID_TRUEHD && codec != AV_CODEC_ID_MLP && codec != AV_CODEC_ID_SPEEX &&
           codec != AV_CODEC_ID_GSM;
}

} // namespace

void CAvDecoder::seek(int64_t frame) {
    const CAvLog log(m_options.log);
    const int64_t ahead = frame - m_position;
    const bool isNear = ahead >= 0 && ahead <= std::llround(kNearby * m_format.rate);
    if (!m_mustRestart && isNear) return drop(ahead);
    if (m_demuxer->isPipe() && !m_mustRestart && ahead >= 0) return drop(ahead);
    const bool canJump = !m_mustRestart && frame > m_format.rate && canStartAnywhere(m_codec->codec_id);
    if (canJump && (seekByPlace(frame) || seekByTime(frame))) return;
    start();
    drop(frame);
}

void CAvDecoder::drop(int64_t frames) {
    const int64_t end = m_position + frames;
    while (m_position < end) {
        if (countPending() == 0) {
            if (readFrame()) convertFrame();
            if (countPending() == 0) return; // the end
        }
        const int64_t count = std::min(end - m_position, countPending());
        m_pendingStart += static_cast<size_t>(count * m_format.frameBytes());
        m_position += count;
    }
}

int64_t CAvDecoder::findFrame(int64_t timestamp) const {
    const AVRational timeBase = m_demuxer->getStream().time_base;
    if (isExact(timeBase)) return av_rescale_q(timestamp - m_firstTime, timeBase, {1, m_format.rate});
    const double frames = static_cast<double>(timestamp - m_firstTime) * av_q2d(timeBase) * m_format.rate;
    const int64_t packets = std::llround((frames - m_firstCount) / m_packetFrames);
    return packets < 0 ? -1 : m_firstCount + packets * m_packetFrames;
}

// Decodes the first frame after a seek.
bool CAvDecoder::continueAfterSeek() {
    avcodec_flush_buffers(m_codec.get());
    m_pending.clear();
    m_pendingStart = 0;
    m_hasDecoded = m_flushed = false;
    m_failures = 0;
    m_damage = nullptr;
    return readFrame();
}

bool CAvDecoder::seekByTime(int64_t frame) {
    if (m_firstTime == AV_NOPTS_VALUE || m_hasScanned) return false;
    const AVRational timeBase = m_demuxer->getStream().time_base;
    if (!isExact(timeBase) && m_packetFrames == 0) return false;
    const int64_t from = frame - std::llround(kPreroll * m_format.rate);
    const int64_t time = m_firstTime + av_rescale_q(from, {1, m_format.rate}, timeBase);
    if (!m_demuxer->seek(time, AVSEEK_FLAG_BACKWARD) || !continueAfterSeek()) return false;
    if (m_frame->pts == AV_NOPTS_VALUE) return false;
    const int64_t at = findFrame(m_frame->pts);
    if (at < 0 || at > frame) return false;
    m_position = at;
    convertFrame();
    drop(frame - at);
    return true;
}

bool CAvDecoder::seekByPlace(int64_t frame) {
    if (m_packets.framesPerPacket == 0) return false;
    const int64_t packet = (frame - std::llround(kPreroll * m_format.rate)) / m_packets.framesPerPacket;
    if (packet < 0 || packet >= static_cast<int64_t>(m_packets.places.size())) return false;
    const int64_t place = m_packets.places[static_cast<size_t>(packet)];
    if (!m_demuxer->seek(place, AVSEEK_FLAG_BYTE) || !continueAfterSeek() || m_place != place) return false;
    m_position = packet * m_packets.framesPerPacket;
    convertFrame();
    drop(frame - m_position);
    return true;
}

} // namespace sonora2::plugins::av

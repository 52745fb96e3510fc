#include "codecs/AvVideoSource.h"

#include "codecs/AvErrors.h"
#include "codecs/AvLog.h"
#include "peru/strings/IStringLocalizer.h"
#include "sonora2/pictures/NV12Picture.h"
#include "sonora2/pictures/RGBPicture.h"
#include "sonora2/pictures/YUY2Picture.h"
#include "sonora2/pictures/YV12Picture.h"

extern "C" {
#include <libavutil/cpu.h>
}

#include <algorithm>
#include <array>
#include <cmath>
#include <new>
#include <utility>

namespace sonora2::plugins::av {

namespace {

constexpr int64_t kMaxPixels = int64_t{8192} * 8192;
constexpr int kMaxThreads = 4;
constexpr int kMaxFailures = 1000;
constexpr double kSameTime = 1e-6;

// Containers do not always find the key picture before a time at the first attempt.
constexpr double kStepsBack[] = {0.0, 2.0, 20.0};

// The layout to deliver, as libav names it. The conversion to RGB of the picture classes expects the range of
// broadcast video, and chroma for every pixel.
AVPixelFormat chooseLayout(const AVFrame& frame, int width, int height) {
    const bool fits = width % 2 == 0 && height % 2 == 0 && frame.color_range != AVCOL_RANGE_JPEG;
    switch (frame.format) {
    case AV_PIX_FMT_NV12:
    case AV_PIX_FMT_YUV420P:
    case AV_PIX_FMT_YUYV422:
        return fits ? static_cast<AVPixelFormat>(frame.format) : AV_PIX_FMT_BGRA;
    default:
        return AV_PIX_FMT_BGRA;
    }
}

} // namespace

CAvVideoSource::CAvVideoSource(const P<common::ISonoraContext>& context, const P<peru::IString>& pluginName,
                               const SMediaFile& file)
    : m_context(context), m_pluginName(pluginName), m_file(file) {}

CAvVideoSource::~CAvVideoSource() = default;

void CAvVideoSource::open() {
    if (isOpened()) return;
    const CAvLog log(m_context->getLogManager());
    try {
        start();
        fitSize(m_frame->width, m_frame->height);
        if (m_startTime > 0.0) find(m_origin + m_startTime);
    } catch (...) {
        close();
        throw;
    }
}

void CAvVideoSource::start() {
    m_demuxer = std::make_unique<CDemuxer>(m_file, AVMEDIA_TYPE_VIDEO);
    openCodec();
    readProperties();
    readNext();
    if (!m_hasNext)
        failToOpen(m_file, peru::localize("sonora2.av.NoPicture", "no picture of it can be decoded"));
}

void CAvVideoSource::openCodec() {
    m_packet.reset(av_packet_alloc());
    m_frame.reset(av_frame_alloc());
    if (!m_packet || !m_frame) throw std::bad_alloc();
    m_codec = m_demuxer->createCodec();
    m_codec->max_pixels = kMaxPixels;
    // One more than there are processors: a thread whose picture is delivered is idle until the next request.
    m_codec->thread_count = std::min(av_cpu_count() + 1, kMaxThreads);
    if (const int error = avcodec_open2(m_codec.get(), nullptr, nullptr); error < 0)
        failToOpen(m_file, describe(error));
    m_flushed = false;
    m_failures = 0;
}

void CAvVideoSource::readProperties() {
    AVFormatContext& format = m_demuxer->getFormat();
    AVStream& stream = m_demuxer->getStream();
    const AVRational rate = av_guess_frame_rate(&format, &stream, nullptr);
    m_frameRate = rate.num > 0 && rate.den > 0 ? rate : AVRational{25, 1};
    m_frameDuration = av_q2d(av_inv_q(m_frameRate));
    const AVRational aspect = av_guess_sample_aspect_ratio(&format, &stream, nullptr);
    m_pixelAspect = aspect.num > 0 && aspect.den > 0 ? aspect : AVRational{1, 1};
    m_duration = std::max(m_demuxer->getDuration(), 0.0);
    m_origin =
        format.start_time != AV_NOPTS_VALUE ? static_cast<double>(format.start_time) / AV_TIME_BASE : 0.0;
    m_nextTime = m_origin - m_frameDuration;
}

void CAvVideoSource::fitSize(int width, int height) {
    m_width = width;
    m_height = height;
    double factor = 1.0;
    if (m_maxWidth > 0) factor = std::min(factor, static_cast<double>(m_maxWidth) / width);
    if (m_maxHeight > 0) factor = std::min(factor, static_cast<double>(m_maxHeight) / height);
    if (factor >= 1.0) return;
    const auto reduce = [factor](int size) { return std::max(static_cast<int>(size * factor) / 2 * 2, 2); };
    m_width = reduce(width);
    m_height = reduce(height);
}

void CAvVideoSource::close() {
    m_hasNext = false;
    m_failure = nullptr;
    m_scaler.reset();
    m_codec.reset();
    m_demuxer.reset();
}

void CAvVideoSource::setMaxSize(int nWidth, int nHeight) {
    m_maxWidth = std::max(nWidth, 0);
    m_maxHeight = std::max(nHeight, 0);
}

void CAvVideoSource::requireOpened() const {
    if (!m_demuxer)
        fail({"sonora2.CDecoderSource.notOpened", "%s is not opened for reading"}, m_file.getDisplayName());
}

double CAvVideoSource::getDuration() {
    return std::max(m_duration - m_startTime, 0.0);
}

void CAvVideoSource::setStartTime(double fStartTime) {
    if (!(fStartTime >= 0.0))
        fail({"sonora2.CDecoderSource.startTime", "%g is not a start time for %s"}, fStartTime,
             m_file.getDisplayName());
    m_startTime = fStartTime;
    if (isOpened()) skipToTime(0.0);
}

double CAvVideoSource::peekNextPictureTimestamp() {
    requireOpened();
    return m_hasNext ? m_nextTime - m_origin - m_startTime : -1.0;
}

P<common::ISonoraPicture> CAvVideoSource::getNextPicture() {
    requireOpened();
    if (m_failure) std::rethrow_exception(std::exchange(m_failure, nullptr));
    if (!m_hasNext) return nullptr;
    const CAvLog log(m_context->getLogManager());
    P<common::ISonoraPicture> picture = makePicture();
    try {
        readNext();
    } catch (...) {
        m_failure = std::current_exception(); // to be thrown after this picture
    }
    return picture;
}

void CAvVideoSource::skipToTime(double fTimestamp) {
    requireOpened();
    const CAvLog log(m_context->getLogManager());
    find(m_origin + m_startTime + std::max(fTimestamp, 0.0));
}

void CAvVideoSource::find(double time) {
    for (const double back : kStepsBack)
        if (goTo(time, time - back)) return;
    close();
    try {
        start();
        advanceTo(time);
    } catch (...) {
        close();
        throw;
    }
}

// Starts to decode at a key picture near `from`; false if that is behind `time`.
bool CAvVideoSource::goTo(double time, double from) {
    const int64_t timestamp = std::llround(from / av_q2d(m_demuxer->getStream().time_base));
    if (!m_demuxer->seek(timestamp, AVSEEK_FLAG_BACKWARD)) return false;
    avcodec_flush_buffers(m_codec.get());
    m_flushed = false;
    m_failures = 0;
    m_failure = nullptr;
    readNext();
    if (!m_hasNext || m_nextTime > time + m_frameDuration) return false;
    advanceTo(time);
    return true;
}

void CAvVideoSource::advanceTo(double time) {
    const Frame last(av_frame_alloc());
    if (!last) throw std::bad_alloc();
    double lastTime = 0.0;
    while (m_hasNext && m_nextTime < time - kSameTime) {
        av_frame_unref(last.get());
        av_frame_move_ref(last.get(), m_frame.get());
        lastTime = m_nextTime;
        readNext();
    }
    if (!m_hasNext && last->width > 0) {
        av_frame_move_ref(m_frame.get(), last.get());
        m_nextTime = lastTime;
        m_hasNext = true;
    }
}

void CAvVideoSource::readNext() {
    m_hasNext = false; // also after a failure
    m_hasNext = decode();
    if (!m_hasNext) return;
    const int64_t timestamp = m_frame->best_effort_timestamp;
    m_nextTime = timestamp != AV_NOPTS_VALUE
                     ? static_cast<double>(timestamp) * av_q2d(m_demuxer->getStream().time_base)
                     : m_nextTime + m_frameDuration;
}

bool CAvVideoSource::decode() {
    for (;;) {
        const int result = avcodec_receive_frame(m_codec.get(), m_frame.get());
        if (result >= 0) {
            m_failures = 0;
            if (m_frame->width > 0 && m_frame->height > 0) return true;
            continue;
        }
        if (result == AVERROR_EOF || (result == AVERROR(EAGAIN) && !sendPacket())) return false;
        if (result != AVERROR(EAGAIN) && ++m_failures > kMaxFailures)
            failAt(m_file, m_nextTime - m_origin, describe(result));
    }
}

bool CAvVideoSource::sendPacket() {
    if (m_flushed) return false;
    if (!m_demuxer->read(*m_packet)) {
        m_flushed = true;
        return avcodec_send_packet(m_codec.get(), nullptr) >= 0;
    }
    const int result = avcodec_send_packet(m_codec.get(), m_packet.get());
    av_packet_unref(m_packet.get());
    if (result < 0 && ++m_failures > kMaxFailures) failAt(m_file, m_nextTime - m_origin, describe(result));
    return true;
}

// The frame is moved into the block if it has the wanted layout and size already.
P<peru::IMemoryBlock> CAvVideoSource::makeBlock(AVPixelFormat format,
                                                const std::vector<CFrameBlock::SPlane>& planes) {
    const P<peru::IMemoryManager> memory = m_context->getMemoryManager();
    if (m_frame->format == format && m_frame->width == m_width && m_frame->height == m_height) {
        Frame frame(av_frame_alloc());
        if (!frame) throw std::bad_alloc();
        av_frame_move_ref(frame.get(), m_frame.get());
        return peru::make<CFrameBlock>(memory, std::move(frame), planes);
    }
    int64_t bytes = 0;
    std::array<int64_t, 4> offsets{};
    std::array<int, 4> pitches{};
    for (const CFrameBlock::SPlane& plane : planes) {
        offsets[static_cast<size_t>(plane.index)] = bytes;
        pitches[static_cast<size_t>(plane.index)] = plane.rowBytes;
        bytes += int64_t{plane.rowBytes} * plane.rows;
    }
    P<peru::IMemoryBlock> block = memory->getBlock(bytes);
    std::array<uint8_t*, 4> data{};
    for (size_t i = 0; i < planes.size(); ++i) data[i] = block->getData() + offsets[i];
    scale(format, data.data(), pitches.data());
    return block;
}

P<common::ISonoraPicture> CAvVideoSource::makePicture() {
    const P<peru::IMemoryManager> memory = m_context->getMemoryManager();
    const double time = m_nextTime - m_origin - m_startTime;
    const int width = m_width, height = m_height;
    switch (chooseLayout(*m_frame, width, height)) {
    case AV_PIX_FMT_NV12:
        return peru::make<common::CNV12Picture>(
            memory, time, width, height, false,
            makeBlock(AV_PIX_FMT_NV12, {{0, width, height}, {1, width, height / 2}}));
    case AV_PIX_FMT_YUV420P: // the block has V before U
        return peru::make<common::CYV12Picture>(
            memory, time, width, height, false,
            makeBlock(AV_PIX_FMT_YUV420P,
                      {{0, width, height}, {2, width / 2, height / 2}, {1, width / 2, height / 2}}));
    case AV_PIX_FMT_YUYV422:
        return peru::make<common::CYUY2Picture>(memory, time, width, height, false,
                                                makeBlock(AV_PIX_FMT_YUYV422, {{0, width * 2, height}}));
    default: {
        const P<peru::IMemoryBlock> block = makeBlock(AV_PIX_FMT_BGRA, {{0, width * 4, height}});
        auto* const pixels = reinterpret_cast<uint32_t*>(block->getData());
        const int64_t count = int64_t{width} * height;
        for (int64_t i = 0; i < count; ++i) pixels[i] |= 0xFF000000u; // pictures are opaque
        return peru::make<common::CRGBPicture>(memory, time, width, height, false, block);
    }
    }
}

void CAvVideoSource::scale(AVPixelFormat format, uint8_t* const planes[], const int pitches[]) {
    const auto own = static_cast<AVPixelFormat>(m_frame->format);
    m_scaler.reset(sws_getCachedContext(m_scaler.release(), m_frame->width, m_frame->height, own, m_width,
                                        m_height, format, SWS_BICUBIC | SWS_ACCURATE_RND, nullptr, nullptr,
                                        nullptr));
    if (!m_scaler) failAt(m_file, m_nextTime - m_origin, describe(AVERROR(EINVAL)));
    const int space = m_frame->colorspace == AVCOL_SPC_UNSPECIFIED ? SWS_CS_DEFAULT : m_frame->colorspace;
    sws_setColorspaceDetails(m_scaler.get(), sws_getCoefficients(space),
                             m_frame->color_range == AVCOL_RANGE_JPEG, sws_getCoefficients(SWS_CS_DEFAULT), 0,
                             0, 1 << 16, 1 << 16);
    sws_scale(m_scaler.get(), m_frame->data, m_frame->linesize, 0, m_frame->height, planes, pitches);
}

} // namespace sonora2::plugins::av

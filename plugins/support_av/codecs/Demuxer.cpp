#include "codecs/Demuxer.h"

#include "codecs/AvErrors.h"
#include "peru/strings/IStringLocalizer.h"

#include <cerrno>
#include <cstdio>
#include <new>
#include <unistd.h>

namespace sonora2::plugins::av {

namespace {

constexpr int kBufferBytes = 64 * 1024;
// What a damaged header may make libav allocate at once.
constexpr size_t kMostBytesAtOnce = 512 * 1024 * 1024;

// Playlists and references to other files are not followed.
int refuseOther(AVFormatContext*, AVIOContext**, const char*, int, AVDictionary**) {
    return AVERROR(EACCES);
}

} // namespace

CDemuxer::CDemuxer(const SMediaFile& file, AVMediaType type, int index)
    : m_file(file), m_isPipe(plugins::isPipe(file)),
      m_input(m_isPipe ? openPipe(file) : openForReading(file)) {
    av_max_alloc(kMostBytesAtOnce);
    auto* const buffer = static_cast<uint8_t*>(av_malloc(kBufferBytes));
    if (buffer)
        m_io.reset(avio_alloc_context(buffer, kBufferBytes, 0, this, m_isPipe ? &readPipe : &readBytes,
                                      nullptr, m_isPipe ? nullptr : &seekBytes));
    m_format = avformat_alloc_context();
    if (!m_io || !m_format) throw std::bad_alloc();
    m_format->pb = m_io.get();
    m_format->io_open = &refuseOther;
    m_format->max_streams = 200;
    // Judged by its content, not by its name. The context is freed on failure.
    int result = avformat_open_input(&m_format, nullptr, nullptr, nullptr);
    if (result >= 0) result = avformat_find_stream_info(m_format, nullptr);
    if (result >= 0) result = m_best = m_stream = av_find_best_stream(m_format, type, -1, -1, nullptr, 0);
    // Covers are pictures, not video.
    const bool isCover =
        result >= 0 && type == AVMEDIA_TYPE_VIDEO &&
        (getStream().disposition & (AV_DISPOSITION_ATTACHED_PIC | AV_DISPOSITION_TIMED_THUMBNAILS));
    if (result == AVERROR_STREAM_NOT_FOUND || isCover) {
        avformat_close_input(&m_format);
        failToOpen(file, type == AVMEDIA_TYPE_VIDEO
                             ? peru::localize("sonora2.av.NoVideo", "there is no video in it")
                             : peru::localize("sonora2.av.NoSound", "there is no sound in it"));
    }
    if (result < 0) {
        avformat_close_input(&m_format);
        failToOpen(file, describe(result));
    }
    // A file that has changed since its streams were listed may have fewer.
    const std::vector<int> streams = listStreams(type);
    if (index > 0 && index < static_cast<int>(streams.size())) m_stream = streams[static_cast<size_t>(index)];
    for (unsigned i = 0; i < m_format->nb_streams; ++i)
        if (static_cast<int>(i) != m_stream) m_format->streams[i]->discard = AVDISCARD_ALL;
}

CDemuxer::~CDemuxer() {
    avformat_close_input(&m_format);
}

std::vector<int> CDemuxer::listStreams(AVMediaType type) const {
    std::vector<int> streams{m_best};
    for (int i = 0; i < static_cast<int>(m_format->nb_streams); ++i)
        if (i != m_best && m_format->streams[i]->codecpar->codec_type == type) streams.push_back(i);
    return streams;
}

std::vector<SSoundtrack> CDemuxer::getSoundtracks() const {
    std::vector<SSoundtrack> tracks;
    for (const int stream : listStreams(AVMEDIA_TYPE_AUDIO)) {
        const auto get = [&](const char* key) {
            const AVDictionaryEntry* const entry =
                av_dict_get(m_format->streams[stream]->metadata, key, nullptr, 0);
            return std::string(entry ? entry->value : "");
        };
        tracks.push_back({get("title"), get("language")});
    }
    return tracks;
}

int CDemuxer::readBytes(void* self, uint8_t* buffer, int size) {
    std::FILE* const file = static_cast<CDemuxer*>(self)->m_input.get();
    const size_t got = std::fread(buffer, 1, static_cast<size_t>(size), file);
    if (got > 0) return static_cast<int>(got);
    return std::ferror(file) ? AVERROR(EIO) : AVERROR_EOF;
}

// Whatever has arrived; a stream would wait for a full buffer.
int CDemuxer::readPipe(void* self, uint8_t* buffer, int size) {
    const int pipe = ::fileno(static_cast<CDemuxer*>(self)->m_input.get());
    ssize_t got;
    do got = ::read(pipe, buffer, static_cast<size_t>(size));
    while (got < 0 && errno == EINTR);
    return got > 0 ? static_cast<int>(got) : got == 0 ? AVERROR_EOF : AVERROR(EIO);
}

int64_t CDemuxer::seekBytes(void* self, int64_t offset, int whence) {
    std::FILE* const file = static_cast<CDemuxer*>(self)->m_input.get();
    if (whence & AVSEEK_SIZE) {
        const off_t position = ::ftello(file);
        if (::fseeko(file, 0, SEEK_END) != 0) return AVERROR(EIO);
        const off_t size = ::ftello(file);
        return ::fseeko(file, position, SEEK_SET) == 0 ? size : AVERROR(EIO);
    }
    return ::fseeko(file, offset, whence & ~AVSEEK_FORCE) == 0 ? ::ftello(file) : AVERROR(EINVAL);
}

double CDemuxer::getDuration() const {
    const AVStream& stream = *m_format->streams[m_stream];
    if (stream.duration > 0) return static_cast<double>(stream.duration) * av_q2d(stream.time_base);
    return m_format->duration > 0 ? static_cast<double>(m_format->duration) / AV_TIME_BASE : -1.0;
}

bool CDemuxer::read(AVPacket& packet) {
    for (;;) {
        const int result = av_read_frame(m_format, &packet);
        if (result == AVERROR(EAGAIN)) continue;
        if (m_io->error < 0 && m_io->error != AVERROR_EOF) failToOpen(m_file, describe(m_io->error));
        if (result < 0) return false; // the rest of a damaged file is found missing by its length
        if (packet.stream_index == m_stream) return true;
        av_packet_unref(&packet);
    }
}

bool CDemuxer::seek(int64_t timestamp, int flags) {
    return av_seek_frame(m_format, m_stream, timestamp, flags) >= 0;
}

Codec CDemuxer::createCodec() {
    const AVCodecParameters* const parameters = getStream().codecpar;
    const AVCodec* const decoder = avcodec_find_decoder(parameters->codec_id);
    if (!decoder) failToOpen(m_file, describe(AVERROR_DECODER_NOT_FOUND));
    Codec codec(avcodec_alloc_context3(decoder));
    if (!codec || avcodec_parameters_to_context(codec.get(), parameters) < 0) throw std::bad_alloc();
    codec->pkt_timebase = getStream().time_base;
    return codec;
}

} // namespace sonora2::plugins::av

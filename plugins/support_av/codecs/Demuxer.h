// Reads the packets of one stream of a media file.
#pragma once

#include "codecs/AvHandles.h"
#include "support/Decoder.h"

#include <vector>

namespace sonora2::plugins::av {

// A pipe is read from its beginning to its end, once. Reads the file itself and nothing else: formats that
// refer to other files or to the network cannot open them. Failures are thrown as CSonoraError.
class CDemuxer {
public:
    // Streams of the type are numbered from 0: first the one that is best by the flags in the file and by its
    // properties, then the others in their order.
    CDemuxer(const SMediaFile& file, AVMediaType type, int index = 0);
    ~CDemuxer();
    CDemuxer(const CDemuxer&) = delete;
    CDemuxer& operator=(const CDemuxer&) = delete;

    AVFormatContext& getFormat() { return *m_format; }
    AVStream& getStream() { return *m_format->streams[m_stream]; }
    std::vector<SSoundtrack> getSoundtracks() const; // in the order of their numbers
    double getDuration() const;                      // seconds; below 0 if unknown
    bool isPipe() const { return m_isPipe; }

    bool read(AVPacket& packet); // false at the end
    // To a packet at or before the time; false if that is not possible. `flags` as of av_seek_frame().
    bool seek(int64_t timestamp, int flags);

    // A decoder for the stream, not opened yet.
    Codec createCodec();

private:
    std::vector<int> listStreams(AVMediaType type) const; // in the order of their numbers
    static int readBytes(void* self, uint8_t* buffer, int size);
    static int readPipe(void* self, uint8_t* buffer, int size);
    static int64_t seekBytes(void* self, int64_t offset, int whence);

    SMediaFile m_file;
    const bool m_isPipe;
    InputFile m_input;
    IoContext m_io;
    AVFormatContext* m_format = nullptr;
    int m_best = -1;
    int m_stream = -1;
};

} // namespace sonora2::plugins::av

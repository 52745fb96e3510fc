#include "sonora2_vorbis/VorbisDecoder.h"

#include "sonora2_vorbis/ChannelOrder.h"
#include "support/Pcm.h"

namespace sonora2::plugins {

namespace {

constexpr int kBytesPerSample = 2;
constexpr int kMaxChannels = 8;

const char* describe(long error) {
    switch (error) {
    case OV_EREAD:
        return "the file cannot be read";
    case OV_ENOTVORBIS:
        return "there is no Vorbis stream in it";
    case OV_EVERSION:
        return "its version of Vorbis is unknown";
    case OV_EBADHEADER:
        return "its header is damaged";
    case OV_EBADLINK:
        return "it is damaged";
    default:
        return "it cannot be decoded";
    }
}

} // namespace

SDecodedMedia CVorbisDecoder::open(const SDecoderOptions&) {
    close();
    InputFile file = openForReading(m_file);
    if (const int error = ov_open_callbacks(file.get(), &m_stream, nullptr, 0, OV_CALLBACKS_DEFAULT);
        error < 0)
        fail("could not open %s: %s", m_file.getDisplayName(), describe(error));
    static_cast<void>(file.release()); // now owned by the stream
    m_opened = true;

    const vorbis_info* info = ov_info(&m_stream, -1);
    const ogg_int64_t frames = ov_pcm_total(&m_stream, -1);
    if (!info || frames < 0) fail("could not open %s: %s", m_file.getDisplayName(), describe(OV_EBADLINK));
    if (info->channels > kMaxChannels)
        fail("could not open %s: it has %d channels", m_file.getDisplayName(), info->channels);
    m_format = {static_cast<int>(info->rate), info->channels, kBytesPerSample};
    // Streams may be chained, but chunks cannot express a change of format.
    for (int link = 0; link < ov_streams(&m_stream); ++link) {
        const vorbis_info* other = ov_info(&m_stream, link);
        if (other->rate != m_format.rate || other->channels != m_format.channels)
            fail("could not open %s: it is a chain of streams in different formats", m_file.getDisplayName());
    }
    return {m_format, frames, "Vorbis"};
}

void CVorbisDecoder::close() {
    if (!m_opened) return;
    ov_clear(&m_stream); // closes the file as well
    m_opened = false;
}

int CVorbisDecoder::read(uint8_t* pcm, int frames) {
    float** planes = nullptr;
    int link = 0;
    long got = OV_HOLE;
    // A hole is a gap where data was lost; decoding continues after it.
    while (got == OV_HOLE) got = ov_read_float(&m_stream, &planes, frames, &link);
    if (got < 0) fail("could not decode %s: %s", m_file.getDisplayName(), describe(got));
    if (got == 0) return 0;

    const float* ordered[kMaxChannels];
    const int* order = getVorbisChannelOrder(m_format.channels);
    for (int i = 0; i < m_format.channels; ++i) ordered[i] = planes[order ? order[i] : i];
    pcm::packPlanesFloat(ordered, m_format.channels, pcm, kBytesPerSample, static_cast<size_t>(got));
    return static_cast<int>(got);
}

void CVorbisDecoder::seek(int64_t frame) {
    if (const int error = ov_pcm_seek(&m_stream, frame); error < 0)
        fail("could not find a place in %s: %s", m_file.getDisplayName(), describe(error));
}

} // namespace sonora2::plugins

#include "sonora2_discio/TrackDecoder.h"

namespace sonora2::plugins::discio {

CTrackDecoder::~CTrackDecoder() {
    close();
}

void CTrackDecoder::require(int32_t result) const {
    if (result == 1) return;
    try {
        m_track->throwFailure();
    } catch (const peru::CException& error) {
        fail("could not read %s: %s", m_file.getDisplayName(), error.getDescription());
    }
}

// The track is looked up each time: there may be another disc in the drive by now.
SDecodedMedia CTrackDecoder::open(const SDecoderOptions&) {
    close();
    try {
        // Not the instance that lasts for the process, which would be lost when this plug-in is unloaded.
        if (!m_library.library) m_library = disciopp::loadLibrary();
        m_track = m_library.library->openTrack(m_file.uri);
    } catch (const peru::CException& error) {
        fail("could not open %s: %s", m_file.getDisplayName(), error.getDescription());
    }
    const DISCIO_PCMAudioStream& stream = m_track->get();
    require(stream.funcs->open(stream.user));
    const SPcmFormat format{stream.funcs->getSampleRate(stream.user),
                            stream.funcs->getChannelCount(stream.user), 2};
    SDecodedMedia media{format, stream.funcs->getFrameCount(stream.user), "CD audio"};
    // Reading a track of a project reads a source of this process, under the application's lock.
    media.isDirect = m_file.uri->getScheme()->equals("discioppvirtualdiscaudiocd");
    return media;
}

void CTrackDecoder::close() {
    if (!m_track) return;
    const DISCIO_PCMAudioStream& stream = m_track->get();
    stream.funcs->close(stream.user);
    m_track.reset();
}

int CTrackDecoder::read(uint8_t* pcm, int frames) {
    const DISCIO_PCMAudioStream& stream = m_track->get();
    int32_t delivered = 0;
    require(stream.funcs->read(stream.user, pcm, frames, &delivered));
    return delivered;
}

void CTrackDecoder::seek(int64_t frame) {
    const DISCIO_PCMAudioStream& stream = m_track->get();
    require(stream.funcs->seek(stream.user, frame));
}

} // namespace sonora2::plugins::discio

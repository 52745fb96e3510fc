// A list of tracks as one source, for players and encoders.
#pragma once

#include "sonora2/media/IAudioSource.h"
#include "sonora2/plugins/IPluginHandler.h"
#include "sonora2/tracks/AudioTracklist.h"
#include "tonewright/Track.h"

#include <atomic>
#include <vector>

namespace tonewright {

// Reads one chunk ahead to detect the end; after a skip that chunk is still delivered first. Skips may come
// from any thread; everything else is for one thread at a time. If a track that is due throws, the exception
// reaches the reader.
class CTracklistAudioSource : public peru::CObject, public sonora2::common::IAudioSource {
public:
    explicit CTracklistAudioSource(const P<sonora2::audio::CAudioTracklist>& tracklist);
    ~CTracklistAudioSource() override;

    // Mixes the tracks over a silent bed of the full length, so that there are no gaps. Opens no medium yet.
    // Throws CSonoraError if the three numbers are not a valid format.
    static P<CTracklistAudioSource> create(const std::vector<P<CTrack>>& tracks,
                                           const P<sonora2::common::IPluginHandler>& pluginHandler,
                                           const P<sonora2::common::ILogManager>& log, int sampleRate,
                                           int channelCount, int bytesPerSample);

    bool isOpened() override { return m_opened; }
    void open() override;
    void close() override;
    void skipToTime(double fTimestamp) override;
    double getDuration() override { return m_tracklist->getDuration(); }
    int getBufferStatus() override { return m_tracklist->getBufferStatus(); }
    bool isEOF() override;
    void setStartTime(double fStartTime) override {}
    double getStartTime() override { return 0.0; }
    P<peru::IURI> getURI() override; // an empty URI
    P<peru::IString> getPluginName() override;
    P<sonora2::audio::IAudioStreamInfos> getAudioStreamInfos() override;
    void setAudioStream(int nAudioIndex) override {}
    P<sonora2::audio::IAudioChunk> getNextAudioChunk() override;
    int getSampleRate() override { return m_tracklist->getSampleRate(); }
    int getChannelCount() override { return m_tracklist->getChannelCount(); }
    int getBytesPerSample() override { return m_tracklist->getBytesPerSample(); }

private:
    P<sonora2::audio::IAudioChunk> fetch();

    const P<sonora2::audio::CAudioTracklist> m_tracklist;
    std::atomic<bool> m_opened{false};
    P<sonora2::audio::IAudioChunk> m_lookAhead;
};

} // namespace tonewright

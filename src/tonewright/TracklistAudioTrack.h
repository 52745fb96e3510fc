// Plays a track of an editor's arrangement in the mixer.
#pragma once

#include "sonora2/plugins/IPluginHandler.h"
#include "sonora2/tracks/AudioChunkUnifierTrack.h"
#include "tonewright/Track.h"

namespace tonewright {

class CTrackModifierFade;

// Has a source while it is open. One thread at a time; in a track list the unifier track in front of it
// ensures that.
class CTracklistAudioTrack : public peru::CObject,
                             public sonora2::audio::IAudioTrack,
                             public sonora2::audio::IMediumTimeTrack {
public:
    // `index` is the track's position in the document and its lane in the list.
    CTracklistAudioTrack(const P<sonora2::common::IPluginHandler>& pluginHandler, const P<CTrack>& track,
                         int sampleRate, int channelCount, int bytesPerSample, int index);
    ~CTracklistAudioTrack() override;

    P<peru::IURI> getURI() override; // an empty URI
    void setURI(const P<peru::IURI>& uri) override {}
    bool isOpened() override { return static_cast<bool>(m_source); }
    void open() override; // throws CError when no plug-in reads the medium
    void close() override;
    int getSortIndex() override { return m_index; }
    double getStartTime() override { return m_track->getTrackStart(); }
    double getDuration() override { return m_track->getDuration(); }
    bool isEnabled() override { return true; }
    P<peru::IString> getDebugText() override;
    int getBufferStatus() override { return 100; }
    // Handles only the skip command, in medium time; see getMediumTime().
    void processCommand(const P<sonora2::common::ITrackCommand>& command) override;
    double getMediumTime(double listTime) const override;
    int getSampleRate() override { return m_sampleRate; }
    int getChannelCount() override { return m_channelCount; }
    int getBytesPerSample() override { return m_bytesPerSample; }
    // Empty at the end of the medium. A fade applies only to chunks that lie entirely within it.
    P<sonora2::audio::IAudioChunk> getNextAudioChunk() override;

private:
    void applyFade(const CTrackModifierFade& fade, sonora2::audio::IAudioChunk& chunk) const;

    const P<CTrack> m_track;
    P<sonora2::common::IAudioSource> m_source;
    const P<sonora2::common::IPluginHandler> m_pluginHandler;
    const int m_sampleRate;
    const int m_channelCount;
    const int m_bytesPerSample;
    const int m_index;
};

} // namespace tonewright

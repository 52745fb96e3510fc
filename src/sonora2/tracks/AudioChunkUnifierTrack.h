// A track in a mixer's list: delivers chunks of one size in the list's format.
#pragma once

#include "peru/threads/IMutex.h"
#include "sonora2/tracks/AudioChunkUnifier.h"

namespace sonora2::audio {

// A track whose skip command uses medium time. A list asks it for the medium time before it skips.
class SONORA2_API IMediumTimeTrack {
public:
    virtual double getMediumTime(double listTime) const = 0; // seconds

protected:
    ~IMediumTimeTrack() = default;
};

// Opening, reading and commands of the inner track run under one lock, so that the list's worker may open it
// while others play; queries that need no open track are passed on without the lock.
class SONORA2_API CAudioChunkUnifierTrack : public peru::CObject, public IAudioTrack {
public:
    // getNextAudioChunk() returns `frames` frames at that rate, channel count and sample width.
    CAudioChunkUnifierTrack(const P<common::ISonoraContext>& context, const P<IAudioTrack>& track, int frames,
                            int sampleRate, int channelCount, int bytesPerSample);
    ~CAudioChunkUnifierTrack() override;

    P<peru::IURI> getURI() override { return m_track->getURI(); }
    void setURI(const P<peru::IURI>& uri) override { m_track->setURI(uri); }
    bool isOpened() override;
    void open() override;
    void close() override;
    int getSortIndex() override { return m_track->getSortIndex(); }
    double getStartTime() override { return m_track->getStartTime(); }
    double getDuration() override { return m_track->getDuration(); }
    bool isEnabled() override { return m_track->isEnabled(); }
    P<peru::IString> getDebugText() override;
    int getBufferStatus() override { return m_track->getBufferStatus(); }
    void processCommand(const P<common::ITrackCommand>& command) override;
    int getSampleRate() override { return m_sampleRate; }
    int getChannelCount() override { return m_channelCount; }
    int getBytesPerSample() override { return m_bytesPerSample; }
    P<IAudioChunk> getNextAudioChunk() override; // empty at the end, and while closed

private:
    P<CAudioChunkUnifier> makeUnifier() const;
    void skipTo(double listTime, const P<common::ITrackCommand>& command);

    const P<common::ISonoraContext> m_context;
    const P<IAudioTrack> m_track;
    const int m_frames;
    const int m_sampleRate;
    const int m_channelCount;
    const int m_bytesPerSample;
    P<peru::IMutex> m_mutex;         // guards the unifier and the inner track's use of its medium
    P<CAudioChunkUnifier> m_unifier; // while open
};

} // namespace sonora2::audio

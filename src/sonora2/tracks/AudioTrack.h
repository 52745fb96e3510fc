// One source on a time line, with its volume ramps, equalizer and speed.
#pragma once

#include "sonora2/context/EmbeddedMutex.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/media/IAudioSource.h"
#include "sonora2/samplerateconverter/SampleRateConverter.h"
#include "sonora2/tracks/IAudioEqualizer.h"
#include "sonora2/tracks/IAudioTrack.h"

#include <atomic>
#include <vector>

namespace sonora2::audio {

// A gain that moves from one factor to another; times in seconds of the source. Applies only to chunks that
// lie entirely within it, and only to 16-bit samples.
struct SVolumeChange {
    double startFactor;
    double endFactor;
    double startTime;
    double endTime;
};

// May be opened, read and closed by any thread. The setters are to be called before the track is played.
class SONORA2_API CAudioTrack : public peru::CObject, public IAudioTrack {
public:
    // `opened`: the source is already open, at its beginning.
    CAudioTrack(const P<common::ISonoraContext>& context, const P<common::IAudioSource>& source, bool opened,
                double startTime, double duration, int sortIndex, const P<peru::IURI>& uri = nullptr,
                const peru::CStringArg& trackId = "");
    ~CAudioTrack() override;

    // Replaces all volume changes by a fade-in and a fade-out; in seconds, 0 for none.
    virtual void setFadeTimes(double fadeIn, double fadeOut);
    virtual void addVolumeChange(double startFactor, double endFactor, double startTime, double endTime);
    virtual void setEqualizerPreset(int preset); // 0 is none; takes effect at the next open
    virtual void setSpeed(double speed);         // 2 is twice as fast and an octave up; 0 is normal
    void setEnabled(bool enabled) { m_enabled = enabled; }

    P<peru::IURI> getURI() override { return m_uri; } // empty for a silent track
    void setURI(const P<peru::IURI>& uri) override { m_uri = uri; }
    bool isOpened() override;
    void open() override; // exceptions of the source propagate
    void close() override;
    int getSortIndex() override { return m_sortIndex; }
    double getStartTime() override { return m_startTime; }
    double getDuration() override { return m_duration; }
    bool isEnabled() override { return m_enabled; }
    P<peru::IString> getDebugText() override;
    int getBufferStatus() override;
    void processCommand(const P<common::ITrackCommand>& command) override;
    int getSampleRate() override;
    int getChannelCount() override;
    int getBytesPerSample() override;
    // A second of silence each time once the source has ended; empty while the track is closed.
    P<IAudioChunk> getNextAudioChunk() override;

private:
    common::IAudioSource& source() const { return *m_guard->getObject(); }
    void makeEqualizer();
    P<IAudioChunk> makeSilence();
    P<IAudioChunk> changeSpeed(const P<IAudioChunk>& chunk);

    P<common::ISonoraContext> m_context;
    P<common::CEmbeddedMutex<common::IAudioSource>> m_guard; // guards the use of the source
    double m_startTime;
    double m_duration;
    P<peru::IURI> m_uri;
    bool m_opened;
    P<peru::IString> m_trackId;
    double m_speed = 0.0;
    P<IAudioToolsHandler> m_toolsHandler;
    P<IAudioEqualizer> m_equalizer;
    int m_equalizerPreset = 0;
    std::atomic<bool> m_enabled{true};
    P<samplerateconverter::CSampleRateConverter> m_converter; // one per stretch between skips
    std::vector<SVolumeChange> m_volumeChanges;
    int m_sortIndex;
};

} // namespace sonora2::audio

// A mixer of audio tracks on a time line.
#pragma once

#include "sonora2/context/ISonoraContext.h"
#include "sonora2/tracks/IAudioTracklist.h"
#include "sonora2/tracks/Tracklist.h"

#include <atomic>

namespace sonora2::audio {

// Once open, delivers chunks from the start of the time line; reopening restarts it. Tracks begin and end at
// chunk boundaries. Works on 16-bit samples.
class SONORA2_API CAudioTracklist : public common::CTracklist, public IAudioTracklist {
public:
    // `openInThread`: tracks are opened ahead and closed on the list's own thread. `framesPerStep` is the
    // length of a chunk. `startTime` is the list's position on the time line of an enclosing list; skip
    // commands are relative to it. Throws CSonoraError for an invalid format.
    CAudioTracklist(bool openInThread, const P<common::ISonoraContext>& context, int sampleRate,
                    int channelCount, int bytesPerSample, int framesPerStep, double startTime, int sortIndex,
                    const peru::CStringArg& trackId = "");
    ~CAudioTracklist() override;

    // Throws CError unless the track is an IAudioTrack.
    void addTrack(const P<common::ITrack>& track, double start, double end) override;
    void processCommand(const P<common::ITrackCommand>& command) override;
    int getBufferStatus() override { return CTracklist::getBufferStatus(); }
    double getDuration() override { return CTracklist::getDuration(); }

    P<peru::IURI> getURI() override; // an empty URI
    void setURI(const P<peru::IURI>& uri) override {}
    bool isOpened() override;
    void open() override;
    void close() override;
    int getSortIndex() override { return getListSortIndex(); }
    double getStartTime() override { return getFixedDuration(); }
    bool isEnabled() override { return m_enabled; }
    P<peru::IString> getDebugText() override;
    int getSampleRate() override { return m_sampleRate; }
    int getChannelCount() override { return m_channelCount; }
    int getBytesPerSample() override { return m_bytesPerSample; }
    // Performs one step; empty at the end of the list and while closed. The caller may modify the chunk.
    P<IAudioChunk> getNextAudioChunk() override;

protected:
    void mix(const Entries& active) override;
    int64_t getPositionMs() override;
    void setPosition(double time) override;

private:
    P<peru::IMemoryBlock> mixActive(const Entries& active);
    P<peru::IMemoryBlock> makeSilence(int frames);
    int64_t getFrameBytes() const { return int64_t{m_channelCount} * m_bytesPerSample; }

    const int m_sampleRate;
    const int m_channelCount;
    const int m_bytesPerSample;
    const P<common::ISonoraContext> m_context;
    const P<peru::IString> m_trackId;
    std::atomic<bool> m_enabled{true};
    const int m_framesPerStep;
    // Guarded by the list's lock:
    bool m_opened = false;
    uint64_t m_position = 0; // frames delivered, or skipped, so far
    P<IAudioChunk> m_current;
};

} // namespace sonora2::audio

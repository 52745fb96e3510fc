// A source that reads from functions of the host.
#pragma once

#include "peru/MemoryManager.h"
#include "peru/Object.h"
#include "sonora2/media/IAudioSource.h"
#include "tonewright/host.h"

#include <functional>

namespace tonewright::host_support {

using peru::P;

struct SHostSamples {
    int32_t rate = 0;
    int32_t channels = 0;
    int32_t bytesPerSample = 0;
    int64_t frames = -1; // -1: unknown

    // Throws CError if the numbers are not a valid sound format.
    void check() const;
};

class CHostSource : public peru::CObject, public sonora2::common::IAudioSource {
public:
    using Read =
        std::function<int64_t(void* samples, int64_t frames)>; // frames read, 0 at the end, -1 on failure
    using Seek = std::function<bool(int64_t frame)>;           // may be empty

    CHostSource(const SHostSamples& format, Read read, Seek seek);
    ~CHostSource() override;

    bool isOpened() override { return m_isOpened; }
    void open() override;
    void close() override { m_isOpened = false; }
    void skipToTime(double fTimestamp) override;
    double getDuration() override;
    int getBufferStatus() override { return 0; }
    bool isEOF() override { return !m_isOpened || m_hasEnded; }
    void setStartTime(double fStartTime) override;
    double getStartTime() override;
    P<peru::IURI> getURI() override; // an empty URI
    P<peru::IString> getPluginName() override;

    P<sonora2::audio::IAudioStreamInfos> getAudioStreamInfos() override;
    void setAudioStream(int nAudioIndex) override; // 0 only
    P<sonora2::audio::IAudioChunk> getNextAudioChunk() override;
    int getSampleRate() override { return m_format.rate; }
    int getChannelCount() override { return m_format.channels; }
    int getBytesPerSample() override { return m_format.bytesPerSample; }

private:
    int64_t toFrame(double seconds) const;
    void moveTo(int64_t frame); // in the host's frames, counted from the beginning

    const SHostSamples m_format;
    const Read m_read;
    const Seek m_seek;
    P<peru::IMemoryManager> m_memory;
    bool m_isOpened = false;
    bool m_hasEnded = false;
    int64_t m_start = 0;    // the host's frame at the source's time 0
    int64_t m_position = 0; // the host's frame that is read next
};

} // namespace tonewright::host_support

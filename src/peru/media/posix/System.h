// The sound engine and its devices.
#pragma once

#include "peru/media/posix/IPosixSystem.h"

namespace peru::media::posix {

// Starts the engine and terminates it with the last device. Enumerating restarts it, unless a stream is open.
class CSystem : public CObject, public virtual IPosixSystem {
public:
    CSystem(); // throws CMediaException
    ~CSystem() override;

    WEnum<IAudioOutDevice> getOutDevices() override;
    WEnum<IAudioInDevice> getInDevices() override;
    P<IAudioOutDevice> getDefaultOutDevice() override;
    P<IAudioInDevice> getDefaultInDevice() override;

    P<IMutex> getEngineMutex() const override { return m_engineMutex; }
    uint64_t getGeneration() const override { return m_generation; }
    void countStream(int difference) override { m_streamCount += difference; }

private:
    void start(); // throws CMediaException
    void refresh();
    template <class Device> P<IEnum> getDevices();

    const P<IMutex> m_engineMutex; // guards the rest
    bool m_isRunning = false;      // the engine, which is not started without any device
    uint64_t m_generation = 0;
    int64_t m_startTime = 0; // monotonic, when the devices were enumerated
    int m_streamCount = 0;
};

} // namespace peru::media::posix

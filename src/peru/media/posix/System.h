// The sound engine and the devices it finds.
#pragma once

#include "peru/media/posix/IPosixSystem.h"

namespace peru::media::posix {

// Starts the engine, and ends it with the last device. The devices are those that were there at the start.
class CSystem : public CObject, public virtual IPosixSystem {
public:
    CSystem(); // throws CMediaException
    ~CSystem() override;

    WEnum<IAudioOutDevice> getOutDevices() override;
    WEnum<IAudioInDevice> getInDevices() override;
    P<IAudioOutDevice> getDefaultOutDevice() override;
    P<IAudioInDevice> getDefaultInDevice() override;

    P<IMutex> getEngineMutex() const override { return m_engineMutex; }

private:
    template <class Device> P<IEnum> getDevices();

    const P<IMutex> m_engineMutex;
    const bool m_hasDevices; // the engine runs only where there are any
};

} // namespace peru::media::posix

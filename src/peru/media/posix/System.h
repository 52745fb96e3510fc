// The sound engine and its devices.
#pragma once

#include "peru/media/posix/IPosixSystem.h"

namespace peru::media::posix {

// Starts the engine and terminates it with the last device. Devices that appear later are not listed.
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
    const bool m_hasDevices; // false if the engine was not started
};

} // namespace peru::media::posix

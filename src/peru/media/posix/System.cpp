#include "peru/media/posix/System.h"

#include "peru/collections/Array.h"
#include "peru/media/Errors.h"
#include "peru/media/posix/AudioInDevice.h"
#include "peru/media/posix/AudioOutDevice.h"
#include "peru/media/posix/SoundLibraries.h"

#include <portaudio.h>

namespace peru::media::posix {

namespace {

bool startEngine() {
    silenceSoundLibraries();
    if (!hasConfiguredDevices()) return false;
    check(Pa_Initialize());
    return true;
}

} // namespace

CSystem::CSystem() : m_engineMutex(getMutexFactory()->createMutex()), m_hasDevices(startEngine()) {}

CSystem::~CSystem() {
    if (m_hasDevices) Pa_Terminate();
}

template <class Device> P<IEnum> CSystem::getDevices() {
    const P<CArray> devices = make<CArray>();
    const P<IPosixSystem> self = P<IPosixSystem>::share(this);
    const int32_t count = m_hasDevices ? check(Pa_GetDeviceCount()) : 0;
    for (int32_t index = 0; index < count; ++index) {
        const P<Device> device = make<Device>(self, index);
        if (device->getMaxChannelCount() > 0) devices->add(device);
    }
    return devices->createEnum();
}

WEnum<IAudioOutDevice> CSystem::getOutDevices() {
    return getDevices<CAudioOutDevice>();
}

WEnum<IAudioInDevice> CSystem::getInDevices() {
    return getDevices<CAudioInDevice>();
}

P<IAudioOutDevice> CSystem::getDefaultOutDevice() {
    const int32_t index = m_hasDevices ? Pa_GetDefaultOutputDevice() : paNoDevice;
    if (index == paNoDevice) return nullptr;
    return make<CAudioOutDevice>(P<IPosixSystem>::share(this), check(index));
}

P<IAudioInDevice> CSystem::getDefaultInDevice() {
    const int32_t index = m_hasDevices ? Pa_GetDefaultInputDevice() : paNoDevice;
    if (index == paNoDevice) return nullptr;
    return make<CAudioInDevice>(P<IPosixSystem>::share(this), check(index));
}

} // namespace peru::media::posix

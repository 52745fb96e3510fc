#include "peru/media/posix/System.h"

#include "peru/collections/Array.h"
#include "peru/media/Errors.h"
#include "peru/media/posix/AudioInDevice.h"
#include "peru/media/posix/AudioOutDevice.h"
#include "peru/media/posix/Engine.h"
#include "peru/media/posix/SoundLibraries.h"
#include "peru/system/ITimeManager.h"

#include <portaudio.h>

namespace peru::media::posix {

namespace {

// How long the engine's list of devices counts as current, in nanoseconds. Saves a second restart when a
// caller asks for outputs and inputs in turn.
constexpr int64_t kFresh = 100'000'000;

} // namespace

CSystem::CSystem() : m_engineMutex(getMutexFactory()->createMutex()) {
    start();
}

CSystem::~CSystem() {
    if (m_isRunning) Pa_Terminate();
}

void CSystem::start() {
    ++m_generation;
    loadEngine();
    silenceSoundLibraries();
    if (hasConfiguredDevices()) {
        check(Pa_Initialize());
        m_isRunning = true;
    }
    m_startTime = getTimeManager()->getMonotonicTime();
}

// The engine enumerates the devices only when it starts.
void CSystem::refresh() {
    if (m_streamCount > 0 || getTimeManager()->getMonotonicTime() - m_startTime < kFresh) return;
    if (m_isRunning) Pa_Terminate();
    m_isRunning = false;
    start();
}

template <class Device> P<IEnum> CSystem::getDevices() {
    CMutexLock lock(m_engineMutex);
    refresh();
    const P<CArray> devices = make<CArray>();
    const P<IPosixSystem> self = P<IPosixSystem>::share(this);
    const int32_t count = m_isRunning ? check(Pa_GetDeviceCount()) : 0;
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
    CMutexLock lock(m_engineMutex);
    refresh();
    const int32_t index = m_isRunning ? Pa_GetDefaultOutputDevice() : paNoDevice;
    if (index == paNoDevice) return nullptr;
    return make<CAudioOutDevice>(P<IPosixSystem>::share(this), check(index));
}

P<IAudioInDevice> CSystem::getDefaultInDevice() {
    CMutexLock lock(m_engineMutex);
    refresh();
    const int32_t index = m_isRunning ? Pa_GetDefaultInputDevice() : paNoDevice;
    if (index == paNoDevice) return nullptr;
    return make<CAudioInDevice>(P<IPosixSystem>::share(this), check(index));
}

} // namespace peru::media::posix

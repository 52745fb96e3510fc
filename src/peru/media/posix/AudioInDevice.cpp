#include "peru/media/posix/AudioInDevice.h"

#include "peru/media/Samples.h"

#include <algorithm>
#include <utility>

namespace peru::media::posix {

CAudioInDevice::CAudioInDevice(const P<IPosixSystem>& system, int32_t index)
    : CAudioDevice(system, index, EDirection::in), m_listenersMutex(getMutexFactory()->createMutex()),
      m_listeners(make<Listeners>()) {}

CAudioInDevice::~CAudioInDevice() {
    try {
        stop();
    } catch (...) {
        // The engine has released the stream in any case.
    }
}

void CAudioInDevice::setFormat(const P<CAudioFormat>& format) {
    m_defaultFormat = format;
}

void CAudioInDevice::open(const P<CAudioFormat>& format) {
    CMutexLock lock(m_streamMutex);
    if (m_stream) return;
    openStream(format ? format : m_defaultFormat, onInput, this);
    m_position = 0.0;
}

void CAudioInDevice::start() {
    CMutexLock lock(m_streamMutex);
    requireOpened();
    if (m_started && !hasGone()) return;
    // A stream that was ended by a listener must be stopped before it can be started again.
    if (m_started) check(Pa_StopStream(m_stream));
    m_started = false;
    m_position = 0.0;
    startStream();
    m_startTime = Pa_GetStreamTime(m_stream);
}

void CAudioInDevice::stop() {
    getPosition();
    PaStream* stream = nullptr;
    {
        CMutexLock lock(m_streamMutex);
        m_state = kDeviceIdle;
        stream = std::exchange(m_stream, nullptr);
        m_started = false;
    }
    // Stopping waits for the callback, so do it without the mutex: a listener may be calling getStatus().
    if (!stream) return;
    const PaError stopped = Pa_IsStreamStopped(stream);
    const PaError result = stopped == 0 ? Pa_StopStream(stream) : stopped;
    closeStream(stream);
    check(result);
}

void CAudioInDevice::close() {
    stop();
}

double CAudioInDevice::getPosition() const {
    CMutexLock lock(m_streamMutex);
    if (m_started && !hasGone()) m_position = std::max(m_position, Pa_GetStreamTime(m_stream) - m_startTime);
    return m_position;
}

void CAudioInDevice::addListener(IAudioInDeviceListener* listener) {
    CMutexLock lock(m_listenersMutex);
    if (listener && !m_listeners->contains(listener)) m_listeners->add(listener);
}

void CAudioInDevice::removeListener(IAudioInDeviceListener* listener) {
    CMutexLock lock(m_listenersMutex);
    m_listeners->remove(listener);
}

int CAudioInDevice::onInput(const void* input, void*, unsigned long frames, const PaStreamCallbackTimeInfo*,
                            PaStreamCallbackFlags, void* self) {
    const CCallbackScope scope;
    auto* device = static_cast<CAudioInDevice*>(self);
    if (!input || frames == 0) return paContinue;
    try {
        // The callback may modify the buffer until it returns.
        return device->hear(static_cast<uint8_t*>(const_cast<void*>(input)),
                            static_cast<int64_t>(frames) * device->m_bytesPerFrame);
    } catch (...) {
        return paAbort;
    }
}

PaStreamCallbackResult CAudioInDevice::hear(uint8_t* input, int64_t size) {
    const int32_t bytesPerSample = m_format->getBytesPerSample();
    const bool runs = m_state == kDeviceRunning;
    const double gain = m_gain;
    if (runs && gain != 1.0) scaleSamples(input, size, bytesPerSample, gain);
    const std::optional<SLevels> levels = readLevels(input, bytesPerSample, m_format->getChannelCount());
    if (bytesPerSample == 1) flipSigns(input, size);

    CMutexLock lock(m_listenersMutex);
    if (m_listeners->getCount() == 0) return paContinue;
    for (size_t i = 0; IAudioInDeviceListener* listener = m_listeners->at(i); ++i)
        if (runs && !listener->onAudioData(input, size)) return paAbort;
    if (!levels) return paContinue;
    const P<CVolumeInfo> volume = make<CVolumeInfo>(levels->left, levels->right);
    for (size_t i = 0; IAudioInDeviceListener* listener = m_listeners->at(i); ++i) listener->onVolume(volume);
    return paContinue;
}

} // namespace peru::media::posix

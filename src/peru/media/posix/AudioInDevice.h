// Recording through the engine.
#pragma once

#include "peru/collections/FrailArray.h"
#include "peru/media/IAudioInDevice.h"
#include "peru/media/posix/AudioDevice.h"

namespace peru::media::posix {

class CAudioInDevice : public CAudioDevice, public virtual IAudioInDevice {
public:
    CAudioInDevice(const P<IPosixSystem>& system, int32_t index); // throws CMediaException
    ~CAudioInDevice() override;

    void setFormat(const P<CAudioFormat>& format) override;
    void open(const P<CAudioFormat>& format = nullptr) override;
    void start() override;
    void stop() override;
    void close() override;
    double getPosition() const override;

    void addListener(IAudioInDeviceListener* listener) override;
    void removeListener(IAudioInDeviceListener* listener) override;

private:
    using Listeners = TFrailArray<IAudioInDeviceListener>;

    static int onInput(const void* input, void* output, unsigned long frames,
                       const PaStreamCallbackTimeInfo* time, PaStreamCallbackFlags flags, void* self);
    PaStreamCallbackResult hear(uint8_t* input, int64_t size);

    P<CAudioFormat> m_defaultFormat;
    double m_startTime = 0.0;        // on the stream's clock
    mutable double m_position = 0.0; // last position returned; both are guarded by the stream's mutex

    // Held while listeners are called, so that a removed listener gets no more calls.
    const P<IMutex> m_listenersMutex;
    const P<Listeners> m_listeners;
};

} // namespace peru::media::posix

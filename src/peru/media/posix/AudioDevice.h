// Common base of the engine's input and output devices.
#pragma once

#include "peru/media/posix/IPosixAudioDevice.h"
#include "peru/media/posix/IPosixSystem.h"
#include "peru/strings/IString.h"

#include <portaudio.h>

#include <atomic>

namespace peru::media::posix {

// Returns the result; throws CPortaudioException if it is an error.
int32_t check(int32_t result);

// Disables thread cancellation for a scope. The engine stops a stream by cancelling its thread at any
// blocking call; callbacks run in such a scope, so that they are not interrupted while they hold a lock.
class CCallbackScope {
public:
    CCallbackScope();
    ~CCallbackScope();
    CCallbackScope(const CCallbackScope&) = delete;
    CCallbackScope& operator=(const CCallbackScope&) = delete;

private:
    int m_oldState = 0;
};

class CAudioDevice : public CObject, public virtual IPosixAudioDevice {
public:
    ~CAudioDevice() override;

    P<IString> getId() const override;
    P<IString> getName() const override { return m_name; }
    P<IString> getListName() const override;
    P<IString> getHostApi() const override { return m_hostApi; }
    bool isDefault() const override { return m_isDefault; }
    int32_t getMaxChannelCount() const override { return m_maxChannelCount; }
    P<CAudioFormat> getFormat(int32_t sampleRate, int32_t bytesPerSample, int32_t channelCount) override;
    bool isOpened() const override;
    int32_t getStatus() const override;
    double getGain() const override { return m_gain; }
    void setGain(double gain) override;
    P<IString> getHostApiDisplayName() const override { return m_hostApiDisplayName; }
    int32_t getDeviceIndex() const override { return m_index; }

protected:
    enum class EDirection { in, out };

    CAudioDevice(const P<IPosixSystem>& system, int32_t index, EDirection direction);

    // The first four require the stream's mutex.
    void openStream(const P<CAudioFormat>& format, PaStreamCallback* callback, void* self);
    void startStream();         // also sets the state, unless starting fails
    bool hasGone() const;       // it was started and the system has ended it since
    void requireOpened() const; // throws
    [[noreturn]] void throwGone() const;

    // Does not require the stream's mutex.
    void closeStream(PaStream* stream);

    const P<IMutex> m_streamMutex; // guards m_stream and m_started
    PaStream* m_stream = nullptr;
    bool m_started = false;
    std::atomic<int32_t> m_state{kDeviceIdle};
    std::atomic<double> m_gain{1.0};

    // Only written while no callback runs.
    P<CAudioFormat> m_format; // of the stream
    int32_t m_bytesPerFrame = 0;

private:
    int32_t findIndex() const; // in the engine's current list; throws if the device has disappeared
    PaStreamParameters getParameters(const CAudioFormat& format) const;
    bool isTaken(const CAudioFormat& format, int32_t& failure) const;

    const P<IPosixSystem> m_system;
    const int32_t m_index; // when the object was created
    const EDirection m_direction;
    // Guarded by the engine's mutex.
    mutable int32_t m_engineIndex;
    mutable uint64_t m_generation; // of m_engineIndex
    P<IString> m_name;
    P<IString> m_hostApi;
    P<IString> m_hostApiDisplayName;
    bool m_isDefault = false;
    int32_t m_maxChannelCount = 0;
    int32_t m_defaultSampleRate = 0;
    double m_latency = 0.0; // the driver's low-latency suggestion
};

} // namespace peru::media::posix

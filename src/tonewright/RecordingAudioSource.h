// Turns an input device into a source that an encoder reads.
#pragma once

#include "peru/media/IAudioInDevice.h"
#include "peru/streams/BufferedIOStream.h"
#include "sonora2/media/IAudioSource.h"
#include "sonora2/samplerateconverter/SampleRateConverter.h"
#include "tonewright/CallbackSlot.h"
#include "tonewright/ICallbackTargets.h"
#include "tonewright/tonewright.h"

#include <atomic>

// The device's thread appends to an unbounded queue and another thread reads chunks of at most one second, so
// that nothing is lost while the reader is blocked. Created closed; open() starts the recording at time 0.
// Deliberately in the global namespace: hosts look the class up by name.
class CRecordingAudioSource : public peru::CObject,
                              public sonora2::common::IAudioSource,
                              public peru::media::IAudioInDeviceListener,
                              public tonewright::IRecordingTarget {
public:
    template <class T> using P = peru::P<T>;

    static constexpr uint32_t kSilenceMilliseconds = 15000;

    // A read from an open device that delivers nothing for that long reports the end of the source.
    CRecordingAudioSource(const P<peru::media::IAudioInDevice>& device, int32_t sampleRate,
                          int32_t channelCount, int32_t bytesPerSample,
                          uint32_t silenceMilliseconds = kSilenceMilliseconds);
    ~CRecordingAudioSource() override; // ends a recording started by this object

    // False if the device has no format that can be converted to the requested one; the reason is in the log
    // and the object is unusable.
    bool isValid() const { return m_isValid; }
    // Callbacks run on the device's thread; null for none. May be set from any thread; a call already under
    // way still completes on the old callback. An exception thrown by a callback ends the recording.
    void setRecordingCallback(TONEWRIGHT_RecordingCallback callback) { m_recordingCallback = callback; }
    void setVolumeCallback(TONEWRIGHT_RecordingVolumeCallback callback) { m_volumeCallback = callback; }
    void setProgressFunction(std::function<bool(double)> function) override;
    void setLevelFunction(std::function<void(double, double)> function) override;

    bool isOpened() override;
    void open() override;
    void close() override; // unread data stays until the next open
    void skipToTime(double) override {}
    double getDuration() override; // the largest finite double: the end is not known
    int getBufferStatus() override { return 0; }
    bool isEOF() override;
    void setStartTime(double) override {}
    double getStartTime() override { return 0.0; }
    P<peru::IURI> getURI() override; // an empty URI
    P<peru::IString> getPluginName() override;

    P<sonora2::audio::IAudioStreamInfos> getAudioStreamInfos() override; // an empty list
    void setAudioStream(int) override {}
    // Waits for data. Returns at most one second, less if less is available.
    P<sonora2::audio::IAudioChunk> getNextAudioChunk() override;
    int getSampleRate() override { return m_sampleRate; }
    int getChannelCount() override { return m_channelCount; }
    int getBytesPerSample() override { return m_bytesPerSample; }

    bool onAudioData(const void* data, int64_t size) override;
    void onVolume(const P<peru::media::CVolumeInfo>& volume) override;

private:
    bool findFormat();
    bool isDeviceFormatWanted() const;
    void restart();
    bool waitForData();

    P<peru::CBufferedIOStream> m_stream;
    P<peru::CMemoryManager> m_memoryManager;
    P<peru::IMutex> m_lock; // guards the stream, the counter and the converter's handle
    const int32_t m_sampleRate;
    const int32_t m_channelCount;
    const int32_t m_bytesPerSample;
    bool m_isValid = false;
    int32_t m_frameSize = 0;         // bytes, in the device's format, as is the next member
    int32_t m_secondSize = 0;        // bytes
    int64_t m_framesDelivered = 0;   // in device frames, since open
    std::atomic<int64_t> m_buffered; // bytes in the stream, readable without the lock
    P<peru::media::CAudioFormat> m_deviceFormat;
    P<sonora2::samplerateconverter::CSampleRateConverter> m_converter; // empty if the formats are equal
    P<peru::media::IAudioInDevice> m_device;
    std::atomic<TONEWRIGHT_RecordingCallback> m_recordingCallback{nullptr};
    std::atomic<TONEWRIGHT_RecordingVolumeCallback> m_volumeCallback{nullptr};
    tonewright::TCallbackSlot<bool(double)> m_progress;
    tonewright::TCallbackSlot<void(double, double)> m_level;

    const uint32_t m_silenceMilliseconds;
    // Guards the device, which allows one caller at a time, against an encoder and a host that closes the
    // source at the same time. Never taken by the device's thread.
    P<peru::IMutex> m_deviceLock;
    bool m_isBegun = false;               // set by open()
    std::atomic<bool> m_isSilent{false};  // the reader has timed out
    std::atomic<bool> m_hasFailed{false}; // the volume callback threw
};

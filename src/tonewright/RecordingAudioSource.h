// Turns an input device into a source that an encoder reads.
#pragma once

#include "peru/media/IAudioInDevice.h"
#include "peru/streams/BufferedIOStream.h"
#include "sonora2/media/IAudioSource.h"
#include "sonora2/samplerateconverter/SampleRateConverter.h"
#include "tonewright/tonewright.h"

#include <atomic>

// The device's thread puts its bytes into a queue without bound and another thread takes chunks of a second
// at most: nothing is lost while the reader is held up. Made closed; open starts the recording and its time
// at 0. In no namespace, so that hosts which know the class by name find it.
class CRecordingAudioSource : public peru::CObject,
                              public sonora2::common::IAudioSource,
                              public peru::media::IAudioInDeviceListener {
public:
    template <class T> using P = peru::P<T>;

    static constexpr uint32_t kSilenceMilliseconds = 15000;

    // A reader of an open device that delivers nothing gets its end after that time.
    CRecordingAudioSource(const P<peru::media::IAudioInDevice>& device, int32_t sampleRate,
                          int32_t channelCount, int32_t bytesPerSample,
                          uint32_t silenceMilliseconds = kSilenceMilliseconds);
    ~CRecordingAudioSource() override; // ends a recording that this object began

    // False where the device has no format from which the wanted one can be made, which is in the log: the
    // object is then of no use.
    bool isValid() const { return m_isValid; }
    // Called on the device's thread; null for none. Any thread; a call already under way still ends on the
    // old one. What a callback throws ends the recording.
    void setRecordingCallback(TONEWRIGHT_RecordingCallback callback) { m_recordingCallback = callback; }
    void setVolumeCallback(TONEWRIGHT_RecordingVolumeCallback callback) { m_volumeCallback = callback; }

    bool isOpened() override;
    void open() override;
    void close() override; // what has not been read stays until open
    void skipToTime(double) override {}
    double getDuration() override; // the greatest finite number: the end is not known
    int getBufferStatus() override { return 0; }
    bool isEOF() override;
    void setStartTime(double) override {}
    double getStartTime() override { return 0.0; }
    P<peru::IURI> getURI() override; // an empty one
    P<peru::IString> getPluginName() override;

    P<sonora2::audio::IAudioStreamInfos> getAudioStreamInfos() override; // of no stream
    void setAudioStream(int) override {}
    // Waits for data. Shorter than a second when less is there.
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
    int32_t m_frameSize = 0;         // bytes, of the device's format, as is the next
    int32_t m_secondSize = 0;        // bytes
    int64_t m_framesDelivered = 0;   // of the device's frames, since it was opened
    std::atomic<int64_t> m_buffered; // what the stream holds, for a look without the lock
    P<peru::media::CAudioFormat> m_deviceFormat;
    P<sonora2::samplerateconverter::CSampleRateConverter> m_converter; // empty where the formats are equal
    P<peru::media::IAudioInDevice> m_device;
    std::atomic<TONEWRIGHT_RecordingCallback> m_recordingCallback{nullptr};
    std::atomic<TONEWRIGHT_RecordingVolumeCallback> m_volumeCallback{nullptr};

    const uint32_t m_silenceMilliseconds;
    // Guards the device, which takes one caller at a time, between an encoder and a host that closes
    // meanwhile; the device's thread never takes it.
    P<peru::IMutex> m_deviceLock;
    bool m_isBegun = false;               // by open
    std::atomic<bool> m_isSilent{false};  // the reader has given up waiting
    std::atomic<bool> m_hasFailed{false}; // the volume callback threw
};

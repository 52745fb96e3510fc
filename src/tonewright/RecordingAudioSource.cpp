#include "tonewright/RecordingAudioSource.h"

#include "peru/log/ILog.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/ITimeManager.h"
#include "peru/threads/IThreadManager.h"
#include "peru/uri/URI.h"
#include "sonora2/media/AudioChunk.h"
#include "sonora2/media/AudioStreamInfos.h"
#include "tonewright/Quietly.h"

#include <limits>

using peru::media::CAudioFormat;
using peru::media::IAudioInDevice;
using sonora2::audio::IAudioChunk;
using sonora2::samplerateconverter::CSampleRateConverter;
using tonewright::quietly;

namespace {

constexpr int kCachedBlocks = 30;
// Always requested from the device: every device has stereo, and mono is mixed here.
constexpr int32_t kDeviceChannels = 2;
constexpr int64_t kNanosecondsPerMillisecond = 1000000;

} // namespace

CRecordingAudioSource::CRecordingAudioSource(const P<IAudioInDevice>& device, int32_t sampleRate,
                                             int32_t channelCount, int32_t bytesPerSample,
                                             uint32_t silenceMilliseconds)
    : m_memoryManager(peru::make<peru::CMemoryManager>(kCachedBlocks)),
      m_lock(peru::getMutexFactory()->createMutex()), m_sampleRate(sampleRate), m_channelCount(channelCount),
      m_bytesPerSample(bytesPerSample), m_buffered(0), m_device(device),
      m_silenceMilliseconds(silenceMilliseconds), m_deviceLock(peru::getMutexFactory()->createMutex()) {
    m_stream = peru::make<peru::CBufferedIOStream>(m_memoryManager);
    if (!findFormat()) return;
    m_frameSize = m_deviceFormat->getBytesPerFrame();
    m_secondSize = m_frameSize * m_deviceFormat->getSampleRate();
    restart();
    m_device->setFormat(m_deviceFormat);
    // Last: the device does not count its listeners, so one whose constructor failed would never be removed.
    m_device->addListener(this);
    m_isValid = true;
}

CRecordingAudioSource::~CRecordingAudioSource() {
    quietly("CRecordingAudioSource", [this] { m_device->removeListener(this); });
    quietly("CRecordingAudioSource", [this] {
        if (m_isBegun && m_device->isOpened()) m_device->close();
    });
}

bool CRecordingAudioSource::findFormat() {
    if (m_sampleRate > 0 && m_channelCount > 0 && m_bytesPerSample > 0)
        m_deviceFormat = m_device->getFormat(m_sampleRate, m_bytesPerSample, kDeviceChannels);
    const bool isConvertible =
        m_deviceFormat && m_bytesPerSample <= 4 &&
        CSampleRateConverter::canConvert(m_deviceFormat->getChannelCount(), m_channelCount);
    if (m_deviceFormat && (isDeviceFormatWanted() || isConvertible)) return true;
    peru::getLogManager()->warning(
        peru::CString::fromUTF8("tonewright_shared"),
        peru::format(
            {"tonewright.CRecordingAudioSource.format",
             "CRecordingAudioSource: the device \"%s\" cannot record %d channels of %d bytes at %d Hz"},
            m_device->getName(), m_channelCount, m_bytesPerSample, m_sampleRate));
    return false;
}

bool CRecordingAudioSource::isDeviceFormatWanted() const {
    return m_deviceFormat->getSampleRate() == m_sampleRate &&
           m_deviceFormat->getBytesPerSample() == m_bytesPerSample &&
           m_deviceFormat->getChannelCount() == m_channelCount;
}

// Each recording needs a new converter: its filter state and timestamps continue from earlier input.
void CRecordingAudioSource::restart() {
    P<CSampleRateConverter> converter;
    if (!isDeviceFormatWanted())
        converter = peru::make<CSampleRateConverter>(
            m_deviceFormat->getSampleRate(), m_deviceFormat->getChannelCount(),
            m_deviceFormat->getBytesPerSample(), m_sampleRate, m_channelCount, m_bytesPerSample);
    peru::CMutexLock lock(m_lock);
    m_stream->clear();
    m_buffered = 0;
    m_framesDelivered = 0;
    m_converter = converter;
    m_isSilent = false;
    m_hasFailed = false;
}

void CRecordingAudioSource::setProgressFunction(std::function<bool(double)> function) {
    m_progress.set(std::move(function));
}

void CRecordingAudioSource::setLevelFunction(std::function<void(double, double)> function) {
    m_level.set(std::move(function));
}

bool CRecordingAudioSource::isOpened() {
    peru::CMutexLock deviceLock(m_deviceLock);
    return m_device->isOpened();
}

void CRecordingAudioSource::open() {
    peru::CMutexLock deviceLock(m_deviceLock);
    if (m_device->isOpened()) return;
    restart();
    m_device->open(m_deviceFormat);
    try {
        m_device->start();
    } catch (...) {
        quietly("CRecordingAudioSource", [this] { m_device->close(); });
        throw;
    }
    m_isBegun = true;
}

void CRecordingAudioSource::close() {
    peru::CMutexLock deviceLock(m_deviceLock);
    // Before taking m_lock: the device's thread may be waiting for it, and close() waits for that thread.
    if (m_device->isOpened()) m_device->close();
    m_isBegun = false;
    peru::CMutexLock lock(m_lock);
    m_framesDelivered = 0;
}

double CRecordingAudioSource::getDuration() {
    return std::numeric_limits<double>::max();
}

bool CRecordingAudioSource::isEOF() {
    // Order matters: the device's last block is in the stream before its status says that it has stopped.
    return (m_device->getStatus() != peru::media::kDeviceRunning || m_isSilent) && m_buffered < 1;
}

peru::P<peru::IURI> CRecordingAudioSource::getURI() {
    return peru::make<peru::CURI>("");
}

peru::P<peru::IString> CRecordingAudioSource::getPluginName() {
    return peru::CString::empty();
}

peru::P<sonora2::audio::IAudioStreamInfos> CRecordingAudioSource::getAudioStreamInfos() {
    return peru::make<sonora2::audio::CAudioStreamInfos>();
}

// False once no more data can arrive.
bool CRecordingAudioSource::waitForData() {
    const P<peru::ITimeManager> clock = peru::getTimeManager();
    const int64_t limit =
        clock->getMonotonicTime() + int64_t{m_silenceMilliseconds} * kNanosecondsPerMillisecond;
    while (m_buffered < 1) {
        if (isEOF()) return false;
        peru::getThreadManager()->sleep(1);
        if (clock->getMonotonicTime() <= limit) continue;
        m_isSilent = true; // readers treat an empty chunk before the end as an error
        return m_buffered > 0;
    }
    return true;
}

peru::P<IAudioChunk> CRecordingAudioSource::getNextAudioChunk() {
    if (!waitForData()) return nullptr;
    const P<peru::IMemoryBlock> block = m_memoryManager->getBlock(m_secondSize);
    P<CSampleRateConverter> converter;
    int64_t size = 0;
    double timestamp = 0.0;
    {
        peru::CMutexLock lock(m_lock);
        size = m_stream->readSome(block->getData(), m_secondSize);
        m_buffered = m_stream->getAvailable();
        timestamp = static_cast<double>(m_framesDelivered) / m_sampleRate;
        // Counted in device frames, whose size may differ from the requested format's. If the formats differ
        // the converter sets the timestamps, from the frames it has put out.
        m_framesDelivered += size / m_frameSize;
        converter = m_converter;
    }
    block->setSize(size);
    // The converter treats an empty block as a flush; open() on another thread may have emptied the stream.
    if (!converter || size == 0) return peru::make<sonora2::audio::CAudioChunk>(timestamp, block);
    return converter->convert(block->getData(), static_cast<int>(size));
}

bool CRecordingAudioSource::onAudioData(const void* data, int64_t size) {
    bool goesOn = !m_hasFailed;
    const bool isDone = quietly("CRecordingAudioSource: the recording ends", [&] {
        {
            peru::CMutexLock lock(m_lock);
            m_stream->write(data, size);
            m_buffered = m_stream->getAvailable();
            m_isSilent = false;
        }
        const TONEWRIGHT_RecordingCallback callback = m_recordingCallback;
        const auto function = m_progress.get();
        if (!callback && !function) return;
        const double position = m_device->getPosition();
        if (callback && !callback(position)) goesOn = false;
        if (function && !(*function)(position)) goesOn = false;
    });
    return isDone && goesOn;
}

void CRecordingAudioSource::onVolume(const P<peru::media::CVolumeInfo>& volume) {
    if (m_hasFailed) return;
    const bool isDone = quietly("CRecordingAudioSource: the recording ends", [&] {
        const TONEWRIGHT_RecordingVolumeCallback callback = m_volumeCallback;
        if (callback) callback(volume->getLeft(), volume->getRight());
        if (const auto function = m_level.get()) (*function)(volume->getLeft(), volume->getRight());
    });
    if (!isDone) m_hasFailed = true;
}

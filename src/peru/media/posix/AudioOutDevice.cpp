#include "peru/media/posix/AudioOutDevice.h"

#include "peru/media/Errors.h"
#include "peru/media/Samples.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/threads/IThreadManager.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace peru::media::posix {

namespace {

constexpr uint32_t kLongestWait = 500; // milliseconds
// A starting sound system fills all its buffers at once, which takes more than a single small write of a
// host: how much should be queued before playback begins, and how long to wait for it.
constexpr double kCushion = 400;   // milliseconds
constexpr int kCushionRounds = 50; // of a millisecond

// Blocks kept for reuse: as many as a full queue has, so that the callback rarely frees one.
constexpr int kCachedBlocks = 1024;

// A playback time further ahead than this is a driver error. In seconds.
constexpr double kMostAhead = 5.0;

// Sound servers buffer slightly more than they report. In seconds.
constexpr double kHeldBack = 0.05;

} // namespace

CAudioOutDevice::CAudioOutDevice(const P<IPosixSystem>& system, int32_t index)
    : CAudioDevice(system, index, EDirection::out), m_signal(getSignalFactory()->createSignal()),
      m_queueMutex(getMutexFactory()->createMutex()) {}

CAudioOutDevice::~CAudioOutDevice() {
    try {
        close();
    } catch (...) {
        // The engine has released the stream in any case.
    }
}

void CAudioOutDevice::open(const P<CAudioFormat>& format, const P<IInStream>& source) {
    CMutexLock lock(m_streamMutex);
    if (m_stream) return;
    const P<IMemoryManager> memory = make<CMemoryManager>(kCachedBlocks);
    const P<CBufferedIOStream> queue = make<CBufferedIOStream>(memory);
    openStream(format, onOutput, this);

    m_framesPerMillisecond = format->getSampleRate() / 1000.0;
    const PaStreamInfo* info = Pa_GetStreamInfo(m_stream);
    m_latency = info ? info->outputLatency : 0.0;
    m_source = source;
    CMutexLock queueLock(m_queueMutex);
    m_memory = memory;
    m_queue = queue;
    m_clock = CPlayClock(format->getSampleRate());
}

void CAudioOutDevice::start() {
    CMutexLock lock(m_streamMutex);
    requireOpened();
    requireAlive();
    if (m_started) {
        m_state = kDeviceRunning;
        return;
    }
    {
        CMutexLock queueLock(m_queueMutex);
        if (m_source || m_queue->getAvailable() > 0)
            m_signal->set();
        else
            m_signal->reset();
    }
    startStream();
}

void CAudioOutDevice::pause() {
    // The stream keeps running and plays silence: stopping it would discard what the system has buffered.
    m_state = kDeviceIdle;
}

void CAudioOutDevice::abort() {
    m_state = kDeviceIdle;
    // Releases a callback that waits for its first data.
    m_signal->set();
    double now = 0.0;
    PaError result = paNoError;
    if (m_started) {
        const bool gone = hasGone();
        if (!gone) now = Pa_GetStreamTime(m_stream);
        result = Pa_AbortStream(m_stream);
        if (gone) result = paNoError; // no error for a stream that has already ended
        m_started = false;
    }
    CMutexLock lock(m_queueMutex);
    m_queue->clear();
    m_clock.drop(now);
    check(result);
}

void CAudioOutDevice::stop() {
    CMutexLock lock(m_streamMutex);
    if (m_stream) abort();
}

void CAudioOutDevice::close() {
    CMutexLock lock(m_streamMutex);
    if (!m_stream) return;
    // If this fails, closing aborts again and reports the error.
    try {
        abort();
    } catch (const CPortaudioException&) {
    }
    PaStream* stream = std::exchange(m_stream, nullptr);
    m_source = nullptr;
    {
        CMutexLock queueLock(m_queueMutex);
        m_queue = nullptr;
        m_memory = nullptr;
    }
    closeStream(stream);
}

void CAudioOutDevice::requireAlive() const {
    if (hasGone()) throwGone();
}

void CAudioOutDevice::write(const void* data, int64_t size) {
    P<IMemoryManager> memory;
    P<CBufferedIOStream> queue;
    {
        CMutexLock lock(m_streamMutex);
        requireOpened();
        requireAlive();
        if (m_source)
            throw CMediaException(localize("peru.media.CAudioOutDevice.HasSource",
                                           "The sound device plays a stream and takes no other data"));
        memory = m_memory;
        queue = m_queue;
    }
    if (size <= 0) return;
    const P<IMemoryBlock> block = memory->getBlock(size);
    std::memcpy(block->getData(), data, static_cast<size_t>(size));
    {
        // If the device was closed meanwhile, it has a different queue or none.
        CMutexLock lock(m_queueMutex);
        queue->append(block);
    }
    m_signal->set();
}

int64_t CAudioOutDevice::getQueuedSize() const {
    CMutexLock lock(m_queueMutex);
    return m_queue ? m_queue->getAvailable() : 0;
}

// The callback adds each block of queued sound to the clock with the time at which the system will play it.
// It does not add the silence that fills a buffer, so pauses and gaps do not count, and once the last block
// has been heard the position is that of the last frame written.
double CAudioOutDevice::getPosition() const {
    CMutexLock lock(m_streamMutex);
    if (!m_stream) return 0.0;
    requireAlive(); // while paused, too: otherwise the position would stay the same for ever
    // A stream that is not running has no clock.
    const double now = m_started ? Pa_GetStreamTime(m_stream) : 0.0;
    CMutexLock queueLock(m_queueMutex);
    const double frames = m_started ? m_clock.getHeard(now) : m_clock.getHeard();
    return frames / m_framesPerMillisecond / 1000.0;
}

int CAudioOutDevice::onOutput(const void*, void* output, unsigned long frames,
                              const PaStreamCallbackTimeInfo* time, PaStreamCallbackFlags, void* self) {
    const CCallbackScope scope;
    auto* device = static_cast<CAudioOutDevice*>(self);
    device->fill(static_cast<uint8_t*>(output), static_cast<int64_t>(frames), *time);
    return paContinue;
}

void CAudioOutDevice::fill(uint8_t* output, int64_t frames, const PaStreamCallbackTimeInfo& time) {
    // The buffer contains old samples. 0 is silence for every width.
    std::memset(output, 0, static_cast<size_t>(frames * m_bytesPerFrame));
    if (!m_signal->wait(0)) {
        // After the wait the system has an underrun and may discard this buffer, so playback begins with the
        // next one.
        if (m_signal->wait(kLongestWait)) gatherCushion();
        return;
    }
    if (m_state != kDeviceRunning) return;

    const int64_t wanted = frames * m_bytesPerFrame;
    int64_t size = m_source ? readSource(output, wanted) : 0;
    {
        CMutexLock lock(m_queueMutex);
        if (!m_source && m_queue) {
            // An incomplete frame stays queued until the rest is written.
            const int64_t whole = m_queue->getAvailable() / m_bytesPerFrame * m_bytesPerFrame;
            size = m_queue->readSome(output, std::min(wanted, whole));
        }
        if (size > 0) m_clock.add(getHearingTime(time), size / m_bytesPerFrame);
    }
    const int32_t bytesPerSample = m_format->getBytesPerSample();
    if (bytesPerSample == 1) flipSigns(output, size);
    if (const double gain = m_gain; gain != 1.0) scaleSamples(output, size, bytesPerSample, gain);
}

void CAudioOutDevice::gatherCushion() const {
    const double wanted = kCushion * m_framesPerMillisecond * m_bytesPerFrame;
    for (int round = 0; round < kCushionRounds && m_state == kDeviceRunning && !m_source; ++round) {
        if (static_cast<double>(getQueuedSize()) >= wanted) return;
        getThreadManager()->sleep(1);
    }
}

int64_t CAudioOutDevice::readSource(uint8_t* output, int64_t size) {
    int64_t done = 0;
    try {
        while (done < size && !m_source->isAtEnd()) {
            const int64_t count = m_source->readSome(output + done, size - done);
            if (count <= 0) break;
            done += count;
        }
    } catch (...) {
        // A failing source counts as ended: the device plays silence.
    }
    return done;
}

double CAudioOutDevice::getHearingTime(const PaStreamCallbackTimeInfo& time) const {
    const double ahead = time.outputBufferDacTime - time.currentTime;
    return time.currentTime + kHeldBack + (ahead > 0.0 && ahead < kMostAhead ? ahead : m_latency);
}

} // namespace peru::media::posix

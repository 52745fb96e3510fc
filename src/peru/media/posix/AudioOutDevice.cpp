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
// A system that starts takes as much at once as its buffers hold, more than one write of a host that writes
// little by little: what is wanted in the queue before the sound begins, and how long it is waited for.
constexpr double kCushion = 400;   // milliseconds
constexpr int kCushionRounds = 50; // of a millisecond

// Blocks kept for reuse: as many as a well-filled queue has, so that the callback seldom frees one.
constexpr int kCachedBlocks = 1024;

// A time further ahead of the callback than this is a driver's mistake. In seconds.
constexpr double kMostAhead = 5.0;

// Sound servers hold back some more than they tell. In seconds.
constexpr double kHeldBack = 0.05;

} // namespace

CAudioOutDevice::CAudioOutDevice(const P<IPosixSystem>& system, int32_t index)
    : CAudioDevice(system, index, EDirection::out), m_signal(getSignalFactory()->createSignal()),
      m_queueMutex(getMutexFactory()->createMutex()) {}

CAudioOutDevice::~CAudioOutDevice() {
    try {
        close();
    } catch (...) {
        // The engine has let go of the stream whatever it answered.
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
    // The stream runs on and plays silence: stopping it would drop what the system has taken already.
    m_state = kDeviceIdle;
}

void CAudioOutDevice::abort() {
    m_state = kDeviceIdle;
    // A callback that waits for its first data goes on at once.
    m_signal->set();
    double now = 0.0;
    PaError result = paNoError;
    if (m_started) {
        const bool gone = hasGone();
        if (!gone) now = Pa_GetStreamTime(m_stream);
        result = Pa_AbortStream(m_stream);
        if (gone) result = paNoError; // what has ended already need not be told to
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
    // Closing aborts once more where aborting failed, and tells of it.
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
    if (hasGone())
        throw CMediaException(localize("peru.media.CAudioOutDevice.Gone",
                                       "The sound device '%NAME%' is not available any more",
                                       {{"%NAME%", getName()}}));
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
        // A device that was closed meanwhile has another queue, or none.
        CMutexLock lock(m_queueMutex);
        queue->append(block);
    }
    m_signal->set();
}

int64_t CAudioOutDevice::getQueuedSize() const {
    CMutexLock lock(m_queueMutex);
    return m_queue ? m_queue->getAvailable() : 0;
}

// The callback hands the queue's sound over in blocks and enters each in the clock with the moment at which
// the system will play it. Silence that fills a buffer up is not entered, so that pauses and want of data
// stop the count; once the last block has been heard the position is that of the last frame that was written.
double CAudioOutDevice::getPosition() const {
    CMutexLock lock(m_streamMutex);
    if (!m_stream) return 0.0;
    requireAlive(); // in a pause too: the position would stay for ever
    // A stream that does not run has no clock to ask.
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
    // What comes in holds old sound. 0 is silence for every width here.
    std::memset(output, 0, static_cast<size_t>(frames * m_bytesPerFrame));
    if (!m_signal->wait(0)) {
        // By the end of a wait the system has run dry, and may drop what it gets before it has noticed. The
        // sound begins with the next buffer.
        if (m_signal->wait(kLongestWait)) gatherCushion();
        return;
    }
    if (m_state != kDeviceRunning) return;

    const int64_t wanted = frames * m_bytesPerFrame;
    int64_t size = m_source ? readSource(output, wanted) : 0;
    {
        CMutexLock lock(m_queueMutex);
        if (!m_source && m_queue) {
            // A frame of which only a part was written waits for the rest.
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
        // A source that fails is one that has no more: the device plays silence, as after its end.
    }
    return done;
}

double CAudioOutDevice::getHearingTime(const PaStreamCallbackTimeInfo& time) const {
    const double ahead = time.outputBufferDacTime - time.currentTime;
    return time.currentTime + kHeldBack + (ahead > 0.0 && ahead < kMostAhead ? ahead : m_latency);
}

} // namespace peru::media::posix

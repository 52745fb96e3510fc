#include "tonewright/Player.h"

#include "peru/Errors.h"
#include "peru/MemoryManager.h"
#include "peru/media/ISystem.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/threads/IThreadManager.h"
#include "tonewright/Quietly.h"
#include "tonewright/ReasonedError.h"

#include <algorithm>
#include <cmath>
#include <optional>

namespace tonewright {

using peru::media::CAudioFormat;
using sonora2::common::IAudioSource;
using sonora2::common::IPluginHandler;

namespace {

constexpr int32_t kFileSampleRate = 44100;
constexpr int32_t kFileBytesPerSample = 2;
constexpr int32_t kFileChannelCount = 2;
constexpr int64_t kClosingSeconds = 5;
constexpr uint8_t kSilentByte = 0x80; // 8-bit samples are unsigned
constexpr int kIdleRounds = 5;
constexpr uint32_t kIdleMilliseconds = 100;
constexpr int kTurnRounds = 10; // of a millisecond

bool hasFormat(IAudioSource& source, const CAudioFormat& format) {
    return source.getSampleRate() == format.getSampleRate() &&
           source.getChannelCount() == format.getChannelCount() &&
           source.getBytesPerSample() == format.getBytesPerSample();
}

} // namespace

// Holds the player's lock on behalf of any thread but the feeding one.
class CPlayer::CTurn {
public:
    explicit CTurn(CPlayer& player) {
        ++player.m_waiting;
        m_lock.emplace(player.m_lock);
        --player.m_waiting;
    }

private:
    std::optional<peru::CMutexLock> m_lock;
};

CPlayer::CPlayer(const P<peru::IURI>& uri, const P<IPluginHandler>& handler)
    : CPlayer(uri, handler, nullptr, kStopMilliseconds) {}

CPlayer::CPlayer(const P<IAudioSource>& source, uint32_t stopMilliseconds)
    : CPlayer(nullptr, nullptr, source, stopMilliseconds) {}

CPlayer::CPlayer(const P<peru::IURI>& uri, const P<IPluginHandler>& handler, const P<IAudioSource>& source,
                 uint32_t stopMilliseconds)
    : m_stopMilliseconds(stopMilliseconds), m_ended(peru::getSignalFactory()->createSignal()),
      m_wake(peru::getSignalFactory()->createSignal()), m_uri(uri), m_handler(handler),
      m_lock(peru::getMutexFactory()->createMutex()), m_control(peru::getMutexFactory()->createMutex()) {
    m_ended->set();
    const auto device = peru::media::getSystem()->getDefaultOutDevice();
    if (!device)
        throw peru::CError(
            peru::localize("tonewright.CPlayer.noDevice", "CPlayer::init could not open audio device"));
    useDevice(device, source);
}

// Without a source one is created in a format of the device.
void CPlayer::useDevice(const P<peru::media::IAudioOutDevice>& device, const P<IAudioSource>& source) {
    const auto format = source ? device->getFormat(source->getSampleRate(), source->getBytesPerSample(),
                                                   source->getChannelCount())
                               : device->getFormat(kFileSampleRate, kFileBytesPerSample, kFileChannelCount);
    // Any other format would play the source at the wrong speed or as noise.
    if (!format || (source && !hasFormat(*source, *format)))
        throw peru::CError(peru::localize("tonewright.CPlayer.noFormat",
                                          "CPlayer::init could not find format for audio device"));
    P<IAudioSource> used = source;
    sonora2::common::clearLastFailure();
    if (!used && m_handler)
        used = m_handler->createAudioSource(m_uri, format->getSampleRate(), format->getChannelCount(),
                                            format->getBitsPerSample() / 8, false);
    if (!used)
        throw CReasonedError(
            peru::localize("tonewright.CPlayer.noSource", "CPlayer::init could not open source"),
            sonora2::common::getLastFailure());
    STitle title;
    title.source = used;
    title.duration = used->getDuration();
    m_titles.clear();
    m_titles.push_back(title);
    m_device = device;
    m_deviceFormat = format;
}

CPlayer::~CPlayer() {
    // stop() would wait for a signal that no thread is left to set.
    if (m_state != TONEWRIGHT_PLAYER_STOPPED) haltQuietly();
    quietly("CPlayer", [this] {
        if (m_device && m_device->isOpened()) m_device->close();
    });
}

void CPlayer::play() {
    {
        peru::CMutexLock control(m_control);
        // A play() that has reached its end may still need half a second to return.
        if (m_isFeeding && m_state == TONEWRIGHT_PLAYER_STOPPED) m_ended->wait(m_stopMilliseconds);
        if (m_isFeeding)
            throw peru::CError(
                peru::localize("tonewright.CPlayer.playing", "CPlayer::play the player is playing already"));
        m_ended->reset();
        m_isFeeding = true;
        m_state = TONEWRIGHT_PLAYER_PLAYING;
    }
    try {
        start();
    } catch (...) {
        // Nothing has played, so a stop() must not wait.
        haltQuietly();
        m_state = TONEWRIGHT_PLAYER_STOPPED;
        m_isFeeding = false;
        m_ended->set();
        throw;
    }
    try {
        feed();
        CTurn turn(*this);
        halt();
    } catch (...) {
        haltQuietly();
        m_isFeeding = false;
        throw;
    }
    m_isFeeding = false;
    m_ended->set();
}

void CPlayer::start() {
    CTurn turn(*this);
    // An earlier pause() may have changed the state meanwhile; a stop stays in effect.
    int32_t paused = TONEWRIGHT_PLAYER_PAUSED;
    m_state.compare_exchange_strong(paused, TONEWRIGHT_PLAYER_PLAYING);
    // The device counts its position from open() and may still hold sound from before the last stop.
    if (m_device->isOpened()) m_device->close();
    if (m_hasPlayed && !m_isDeviceChosen) followDefaultDevice();
    m_hasPlayed = true;
    openDevice();
    m_writtenBytes = 0;
    m_isSilenceWritten = false;
    STitle& title = m_titles.front();
    title.begin = title.offset = 0.0;
    if (!title.source->isOpened()) title.source->open();
    if (const std::optional<double> time = std::exchange(m_startTime, std::nullopt)) {
        title.source->skipToTime(*time);
        title.offset = *time;
    }
    m_device->start();
}

void CPlayer::openDevice() {
    if (!m_device->isOpened()) m_device->open(m_deviceFormat);
}

int64_t CPlayer::getBytesPerSecond() const {
    return int64_t{m_deviceFormat->getSampleRate()} * m_deviceFormat->getBytesPerFrame();
}

void CPlayer::feed() {
    double lastPosition = -1.0;
    for (;;) {
        fillQueue();
        idle();
        if (m_state == TONEWRIGHT_PLAYER_STOPPED) return;
        bool isEnd = false;
        {
            CTurn turn(*this);
            if (m_state == TONEWRIGHT_PLAYER_STOPPED) return;
            // Also ends a source that is shorter than its stated duration: all is written and the queue is
            // empty.
            const double position = m_device->getPosition();
            const bool isDry = m_isSilenceWritten && m_state == TONEWRIGHT_PLAYER_PLAYING &&
                               position == lastPosition && m_device->getQueuedSize() == 0;
            lastPosition = position;
            isEnd = isDry || isPastEnd();
            if (isEnd) halt();
        }
        reportState();
        if (isEnd) return;
    }
}

void CPlayer::fillQueue() {
    for (;;) {
        for (int i = 0; i < kTurnRounds && m_waiting > 0; ++i) peru::getThreadManager()->yield(true);
        {
            peru::CMutexLock lock(m_lock);
            if (m_state != TONEWRIGHT_PLAYER_PLAYING || m_device->getQueuedSize() >= m_queueLimit) return;
            if (!writeNext()) return;
            if (m_state != TONEWRIGHT_PLAYER_STOPPED && isPastEnd()) halt();
        }
        reportState();
    }
}

bool CPlayer::writeNext() {
    if (m_isSilenceWritten) return false;
    while (m_titles.back().source->isEOF() && beginNext()) {
    }
    const P<IAudioSource> source = m_titles.back().source;
    if (!source->isEOF()) {
        if (const P<sonora2::audio::IAudioChunk> chunk = source->getNextAudioChunk()) {
            m_device->write(chunk->getData(), chunk->getSize());
            m_writtenBytes += chunk->getSize();
        } else if (!source->isEOF()) {
            throw peru::CError(peru::localize("tonewright.CPlayer.noChunk",
                                              "CPlayer: source return Chunk=NULL but is not EOF"));
        }
    }
    if (!source->isEOF() || !m_queue.empty()) return true;
    // Another source may still be queued: silence in front of it would be a gap.
    if (m_isQueueUsed && m_device->getQueuedSize() > getBytesPerSecond()) return false;
    writeSilence();
    m_isSilenceWritten = true;
    return true;
}

bool CPlayer::beginNext() {
    while (!m_queue.empty()) {
        const P<IAudioSource> source = m_queue.front();
        m_queue.pop_front();
        const bool isOpened = quietly("CPlayer: skipped a queued source", [&] {
            if (!source->isOpened()) source->open();
            if (!hasFormat(*source, *m_deviceFormat))
                throw peru::CError(
                    peru::localize("tonewright.CPlayer.otherFormat", "the device has another format"));
        });
        if (!isOpened) continue;
        STitle title;
        title.source = source;
        title.duration = source->getDuration();
        title.begin = static_cast<double>(m_writtenBytes) / static_cast<double>(getBytesPerSecond());
        title.offset = -title.begin;
        m_titles.push_back(title);
        return true;
    }
    return false;
}

// Pushes the device's position past the last sample, whatever latency the sound system has.
void CPlayer::writeSilence() {
    const int64_t size = kClosingSeconds * getBytesPerSecond();
    auto silence = peru::make<peru::CMemoryBlock>(size);
    std::fill_n(silence->getData(), size,
                m_deviceFormat->getBytesPerSample() == 1 ? kSilentByte : uint8_t{0});
    m_device->write(silence->getData(), size);
}

void CPlayer::idle() {
    for (int round = 0; round < kIdleRounds; ++round) {
        reportState();
        const bool isWoken = m_wake->wait(kIdleMilliseconds);
        m_wake->reset();
        CTurn turn(*this);
        if (isWoken || !m_device->isOpened()) return;
    }
}

void CPlayer::pause() {
    SReport made;
    {
        CTurn turn(*this);
        int32_t state = m_state;
        if (m_isFeeding && state == TONEWRIGHT_PLAYER_STOPPED) return;
        if (m_device->getStatus() != peru::media::kDeviceRunning) {
            if (!m_state.compare_exchange_strong(state, TONEWRIGHT_PLAYER_PLAYING)) return;
            openDevice();
            m_device->start();
            m_wake->set();
        } else {
            m_device->pause();
            m_state.compare_exchange_strong(state, TONEWRIGHT_PLAYER_PAUSED); // unless stopped since
        }
        if (!isObserved()) return;
        made = makeReport();
    }
    report(made);
}

void CPlayer::stop() {
    if (m_state == TONEWRIGHT_PLAYER_STOPPED) return;
    peru::CMutexLock control(m_control);
    if (m_state == TONEWRIGHT_PLAYER_STOPPED) return;
    m_state = TONEWRIGHT_PLAYER_STOPPED;
    m_wake->set();
    if (!m_ended->wait(m_stopMilliseconds))
        throw peru::CError(peru::localize("tonewright.CPlayer.notStopped",
                                          "playerthread could not be stopped in 10seconds"));
    CTurn turn(*this);
    halt();
}

void CPlayer::halt() {
    m_state = TONEWRIGHT_PLAYER_STOPPED;
    // Whatever its status: a paused device would go on playing silence for as long as the player lives.
    if (m_titles.size() > 1) quietly("CPlayer", [this] { getHeard(m_device->getPosition()); });
    if (m_device->isOpened()) m_device->stop();
    returnUnheard();
    if (m_titles.front().source->isOpened()) m_titles.front().source->close();
}

void CPlayer::haltQuietly() {
    quietly("CPlayer", [this] {
        CTurn turn(*this);
        if (m_device->isOpened()) m_device->stop();
    });
    quietly("CPlayer", [this] {
        CTurn turn(*this);
        returnUnheard();
        if (m_titles.front().source->isOpened()) m_titles.front().source->close();
    });
}

void CPlayer::returnUnheard() {
    while (m_titles.size() > 1) {
        const P<IAudioSource> source = m_titles.back().source;
        m_titles.pop_back();
        m_queue.push_front(source);
        if (source->isOpened()) source->close();
    }
}

CPlayer::STitle& CPlayer::getHeard(double position) {
    while (m_titles.size() > 1 && position >= m_titles[1].begin) {
        const P<IAudioSource> ended = m_titles.front().source;
        m_titles.pop_front();
        ++m_sourceIndex;
        quietly("CPlayer", [&] {
            if (ended->isOpened()) ended->close();
        });
    }
    return m_titles.front();
}

// A source that another one follows is played to its last sample, whatever its stated duration.
bool CPlayer::isPastEnd() {
    const double position = m_device->getPosition();
    const STitle& heard = getHeard(position);
    return m_titles.size() == 1 && m_queue.empty() && position + heard.offset > heard.duration;
}

void CPlayer::restartAt(double seconds) {
    STitle& heard = getHeard(m_device->getPosition());
    heard.source->skipToTime(seconds); // first: a source that cannot seek goes on undisturbed
    returnUnheard();
    m_device->stop();
    const double position = m_device->getPosition();
    heard.offset = seconds - position;
    m_writtenBytes = std::llround(position * static_cast<double>(getBytesPerSecond()));
    m_isSilenceWritten = false;
    if (m_state == TONEWRIGHT_PLAYER_PLAYING) m_device->start();
    m_wake->set();
}

void CPlayer::seek(double seconds) {
    if (std::isnan(seconds)) throw peru::CInvalidArgError("seconds", "CPlayer::seek");
    seconds = std::max(seconds, 0.0);
    CTurn turn(*this);
    if (!m_isFeeding || m_state == TONEWRIGHT_PLAYER_STOPPED || !m_titles.front().source->isOpened())
        m_startTime = seconds;
    else
        restartAt(seconds);
}

void CPlayer::setVolume(double factor) {
    if (!std::isfinite(factor) || factor < 0.0) throw peru::CInvalidArgError("factor", "CPlayer::setVolume");
    CTurn turn(*this);
    m_volume = factor;
    m_device->setGain(factor);
}

double CPlayer::getVolume() {
    CTurn turn(*this);
    return m_volume;
}

// The default may have changed since the last play(). If the new one cannot be used, the old one may still be
// there.
void CPlayer::followDefaultDevice() {
    quietly("CPlayer", [this] {
        const auto device = peru::media::getSystem()->getDefaultOutDevice();
        const auto isSame = [this, &device] {
            return device->getName()->equals(m_device->getName()) &&
                   device->getHostApiDisplayName()->equals(m_device->getHostApiDisplayName());
        };
        if (device && device != m_device && !isSame()) exchangeDevice(device);
    });
}

void CPlayer::exchangeDevice(const P<peru::media::IAudioOutDevice>& device) {
    const P<IAudioSource> source = m_titles.front().source;
    const auto format =
        device->getFormat(source->getSampleRate(), source->getBytesPerSample(), source->getChannelCount());
    const bool isConvertible = m_handler && m_sourceIndex == 0 && (!format || !hasFormat(*source, *format));
    useDevice(device, isConvertible ? nullptr : source);
    m_device->setGain(m_volume);
}

void CPlayer::setDevice(const P<peru::media::IAudioOutDevice>& device) {
    if (!device) throw peru::CInvalidArgError("device", "CPlayer::setDevice");
    const auto requireStopped = [this] {
        if (m_isFeeding)
            throw peru::CError(
                peru::localize("tonewright.CPlayer.setDevice", "CPlayer::setDevice the player is playing"));
    };
    requireStopped(); // before the lock: a stop that waits for this thread holds it
    peru::CMutexLock control(m_control);
    CTurn turn(*this);
    requireStopped();
    const P<peru::media::IAudioOutDevice> old = m_device;
    exchangeDevice(device);
    if (old->isOpened()) old->close();
    m_isDeviceChosen = true;
    m_state = TONEWRIGHT_PLAYER_STOPPED;
}

bool CPlayer::enqueue(const P<IAudioSource>& source) {
    if (!source) throw peru::CInvalidArgError("source", "CPlayer::enqueue");
    CTurn turn(*this);
    if (!hasFormat(*source, *m_deviceFormat)) return false;
    m_isQueueUsed = true;
    m_queue.push_back(source);
    if (m_isSilenceWritten && m_isFeeding && m_state != TONEWRIGHT_PLAYER_STOPPED) {
        const double position = m_device->getPosition();
        restartAt(position + getHeard(position).offset);
    }
    m_wake->set();
    return true;
}

int32_t CPlayer::getSourceIndex() {
    CTurn turn(*this);
    if (m_device->isOpened()) getHeard(m_device->getPosition());
    return m_sourceIndex;
}

void CPlayer::setProgressFunction(std::function<void(double, double, int32_t)> function) {
    m_progress.set(std::move(function));
}

CPlayer::SReport CPlayer::makeReport() {
    const int32_t state = m_state;
    if (state == TONEWRIGHT_PLAYER_STOPPED) return {m_titles.front().duration, 0.0, state};
    const double position = m_device->getPosition();
    const STitle& heard = getHeard(position);
    return {heard.duration, position + heard.offset, state};
}

void CPlayer::reportState() {
    if (!isObserved()) return;
    SReport made;
    {
        CTurn turn(*this);
        made = makeReport();
    }
    report(made);
}

void CPlayer::report(const SReport& report) const {
    const TONEWRIGHT_PlayerCallback callback = m_callback;
    if (callback) callback(report.duration, report.position, report.state);
    if (const auto function = m_progress.get()) (*function)(report.duration, report.position, report.state);
}

} // namespace tonewright

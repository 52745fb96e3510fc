#include "tonewright/Player.h"

#include "peru/Errors.h"
#include "peru/MemoryManager.h"
#include "peru/media/ISystem.h"
#include "peru/threads/IThreadManager.h"
#include "tonewright/Quietly.h"

#include <algorithm>
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
constexpr uint32_t kStopMilliseconds = 10000;

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
    : CPlayer(uri, handler, nullptr) {}

CPlayer::CPlayer(const P<IAudioSource>& source) : CPlayer(nullptr, nullptr, source) {}

CPlayer::CPlayer(const P<peru::IURI>& uri, const P<IPluginHandler>& handler, const P<IAudioSource>& source)
    : m_ended(peru::getSignalFactory()->createSignal()), m_uri(uri),
      m_lock(peru::getMutexFactory()->createMutex()), m_control(peru::getMutexFactory()->createMutex()) {
    m_ended->set();
    m_device = peru::media::getSystem()->getDefaultOutDevice();
    if (!m_device) throw peru::CError("CPlayer::init could not open audio device");
    m_deviceFormat = source ? m_device->getFormat(source->getSampleRate(), source->getBytesPerSample(),
                                                  source->getChannelCount())
                            : m_device->getFormat(kFileSampleRate, kFileBytesPerSample, kFileChannelCount);
    // Any other format would play the source at the wrong speed or as noise.
    if (!m_deviceFormat || (source && !hasFormat(*source, *m_deviceFormat)))
        throw peru::CError("CPlayer::init could not find format for audio device");
    m_source = source;
    if (!m_source && handler)
        m_source = handler->createAudioSource(m_uri, m_deviceFormat->getSampleRate(),
                                              m_deviceFormat->getChannelCount(),
                                              m_deviceFormat->getBitsPerSample() / 8, false);
    if (!m_source) throw peru::CError("CPlayer::init could not open source");
    m_duration = m_source->getDuration();
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
        if (m_isFeeding && m_state == TONEWRIGHT_PLAYER_STOPPED) m_ended->wait(kStopMilliseconds);
        if (m_isFeeding) throw peru::CError("CPlayer::play the player is playing already");
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
    openDevice();
    if (!m_source->isOpened()) m_source->open();
    m_device->start();
}

void CPlayer::openDevice() {
    if (!m_device->isOpened()) m_device->open(m_deviceFormat);
}

void CPlayer::feed() {
    bool isSilenceWritten = false;
    double lastPosition = -1.0;
    for (;;) {
        fillQueue(isSilenceWritten);
        idle();
        if (m_state == TONEWRIGHT_PLAYER_STOPPED) return;
        CTurn turn(*this);
        if (m_state == TONEWRIGHT_PLAYER_STOPPED) return;
        // Also ends a source that is shorter than its stated duration: all is written and the queue is empty.
        const double position = m_device->getPosition();
        const bool isDry = isSilenceWritten && m_state == TONEWRIGHT_PLAYER_PLAYING &&
                           position == lastPosition && m_device->getQueuedSize() == 0;
        lastPosition = position;
        if (position > m_duration || isDry) {
            halt();
            return report();
        }
        report();
    }
}

void CPlayer::fillQueue(bool& isSilenceWritten) {
    for (;;) {
        for (int i = 0; i < kTurnRounds && m_waiting > 0; ++i) peru::getThreadManager()->yield(true);
        peru::CMutexLock lock(m_lock);
        if (m_state != TONEWRIGHT_PLAYER_PLAYING || m_device->getQueuedSize() >= m_queueLimit) return;
        writeNext(isSilenceWritten);
        if (m_state != TONEWRIGHT_PLAYER_STOPPED && isPastEnd()) halt();
        report();
        if (isSilenceWritten) return;
    }
}

void CPlayer::writeNext(bool& isSilenceWritten) {
    if (!m_source->isEOF()) {
        if (const P<sonora2::audio::IAudioChunk> chunk = m_source->getNextAudioChunk())
            m_device->write(chunk->getData(), chunk->getSize());
        else if (!m_source->isEOF())
            throw peru::CError("CPlayer: source return Chunk=NULL but is not EOF");
    }
    if (isSilenceWritten || !m_source->isEOF()) return;
    writeSilence();
    isSilenceWritten = true;
}

// Pushes the device's position past the last sample, whatever latency the sound system has.
void CPlayer::writeSilence() {
    const int64_t size =
        kClosingSeconds * m_deviceFormat->getSampleRate() * m_deviceFormat->getBytesPerFrame();
    auto silence = peru::make<peru::CMemoryBlock>(size);
    std::fill_n(silence->getData(), size,
                m_deviceFormat->getBytesPerSample() == 1 ? kSilentByte : uint8_t{0});
    m_device->write(silence->getData(), size);
}

void CPlayer::idle() {
    for (int round = 0; round < kIdleRounds; ++round) {
        report();
        peru::getThreadManager()->sleep(kIdleMilliseconds);
        CTurn turn(*this);
        if (!m_device->isOpened()) return;
    }
}

void CPlayer::pause() {
    CTurn turn(*this);
    int32_t state = m_state;
    if (m_isFeeding && state == TONEWRIGHT_PLAYER_STOPPED) return;
    if (m_device->getStatus() != peru::media::kDeviceRunning) {
        if (!m_state.compare_exchange_strong(state, TONEWRIGHT_PLAYER_PLAYING)) return;
        openDevice();
        report();
        m_device->start();
    } else {
        m_device->pause();
        m_state.compare_exchange_strong(state, TONEWRIGHT_PLAYER_PAUSED); // unless stopped since
        report();
    }
}

void CPlayer::stop() {
    if (m_state == TONEWRIGHT_PLAYER_STOPPED) return;
    peru::CMutexLock control(m_control);
    if (m_state == TONEWRIGHT_PLAYER_STOPPED) return;
    m_state = TONEWRIGHT_PLAYER_STOPPED;
    if (!m_ended->wait(kStopMilliseconds))
        throw peru::CError("playerthread could not be stopped in 10seconds");
    CTurn turn(*this);
    halt();
}

void CPlayer::halt() {
    m_state = TONEWRIGHT_PLAYER_STOPPED;
    // Whatever its status: a paused device would go on playing silence for as long as the player lives.
    if (m_device->isOpened()) m_device->stop();
    if (m_source->isOpened()) m_source->close();
}

void CPlayer::haltQuietly() {
    quietly("CPlayer", [this] {
        CTurn turn(*this);
        if (m_device->isOpened()) m_device->stop();
    });
    quietly("CPlayer", [this] {
        CTurn turn(*this);
        if (m_source->isOpened()) m_source->close();
    });
}

void CPlayer::report() const {
    const TONEWRIGHT_PlayerCallback callback = m_callback;
    if (!callback) return;
    const int32_t state = m_state;
    callback(m_duration, state == TONEWRIGHT_PLAYER_STOPPED ? 0.0 : m_device->getPosition() + m_startOffset,
             state);
}

} // namespace tonewright

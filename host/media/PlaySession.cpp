#include "media/PlaySession.h"

#include "base/Translation.h"
#include "library/Failure.h"

#include <algorithm>
#include <chrono>
#include <stdexcept>
#include <system_error>
#include <tonewright/host.h>

namespace host {

// Used by all threads of a session, and freed by the last one.
class CPlaySession::CShared {
public:
    CShared(CLibrary& library, const CHandle& source, const std::string& device)
        : m_library(library), m_player(library.CreatePlayerFromAudioSource(source.get())) {
        ++s_alive;
        if (m_player &&
            (device.empty() || TONEWRIGHT_Host_SetPlayerDevice(m_player.get(), device.c_str()) == 1)) {
            TONEWRIGHT_Host_SetPlayerProgress(m_player.get(), onProgress, this);
            return;
        }
        --s_alive;
        throw std::runtime_error(takeFailure(tr("host.Play.device", "The sound device cannot be used")));
    }
    ~CShared() {
        m_player.reset();
        --s_alive;
    }
    CShared(const CShared&) = delete;
    CShared& operator=(const CShared&) = delete;

    void play() { // returns at the end
        clearFailure();
        if (m_library.Player_Play(m_player.get()) != TONEWRIGHT_OK) {
            m_reason = takeFailure(tr("host.Play.sound", "The sound cannot be played"));
            TONEWRIGHT_Host_SetPlayerProgress(m_player.get(), nullptr, nullptr);
        }
        m_hasEnded = true;
    }
    void stop() { m_library.Player_Stop(m_player.get()); } // waits for play() to end
    void togglePause() { m_library.Player_Pause(m_player.get()); }
    TONEWRIGHT_Handle getPlayer() const { return m_player.get(); }

    std::atomic<double> m_position{0};
    std::atomic<int32_t> m_state{TONEWRIGHT_PLAYER_STOPPED};
    std::atomic<bool> m_hasBegun{false};
    std::string m_reason;
    std::atomic<bool> m_hasEnded{false}; // publishes the reason
    static inline std::atomic<int> s_alive{0};

private:
    static void onProgress(double, double position, int32_t state, void* user) {
        auto& self = *static_cast<CShared*>(user);
        if (state != TONEWRIGHT_PLAYER_STOPPED) { // a stopped player reports 0
            self.m_position = position;
            self.m_hasBegun = true;
        }
        self.m_state = state;
    }

    CLibrary& m_library;
    CHandle m_player;
};

CPlaySession::CPlaySession(CLibrary& library, const CHandle& source, const std::string& device)
    : m_shared(std::make_shared<CShared>(library, source, device)) {}

CPlaySession::~CPlaySession() {
    if (m_player.joinable()) {
        // A stop before playback has begun would have no effect.
        while (!hasEnded() && !hasBegun()) std::this_thread::sleep_for(std::chrono::milliseconds(1));
        if (!hasEnded()) stop();
    }
    finish();
}

bool CPlaySession::isAnyAlive() {
    return CShared::s_alive > 0;
}

void CPlaySession::start(double seconds) {
    if (seconds > 0) TONEWRIGHT_Host_SeekPlayer(m_shared->getPlayer(), seconds);
    m_player = std::thread([shared = m_shared] { shared->play(); });
}

bool CPlaySession::enqueue(const CHandle& source) {
    return TONEWRIGHT_Host_EnqueueSource(m_shared->getPlayer(), source.get()) == 1;
}

int CPlaySession::getIndex() const {
    return std::max(TONEWRIGHT_Host_GetPlayerSourceIndex(m_shared->getPlayer()), 0);
}

CPlaySession::SState CPlaySession::getState() const {
    return {m_shared->m_position, m_shared->m_state == TONEWRIGHT_PLAYER_PAUSED};
}

bool CPlaySession::hasBegun() const {
    return m_shared->m_hasBegun;
}

bool CPlaySession::hasEnded() const {
    return m_shared->m_hasEnded;
}

void CPlaySession::togglePause() {
    if (hasBegun() && !hasEnded()) m_shared->togglePause();
}

void CPlaySession::stop() {
    if (m_stopper.joinable() || !hasBegun() || hasEnded()) return;
    try {
        // Stopping waits for the player's thread, which may take a while.
        m_stopper = std::thread([shared = m_shared] { shared->stop(); });
    } catch (const std::system_error&) {
        m_shared->stop();
    }
}

void CPlaySession::seek(double seconds) {
    if (!hasBegun() || hasEnded()) return;
    // The next report corrects it; until then further steps start there.
    if (TONEWRIGHT_Host_SeekPlayer(m_shared->getPlayer(), seconds) == 1) m_shared->m_position = seconds;
}

void CPlaySession::setVolume(double factor) {
    TONEWRIGHT_Host_SetPlayerVolume(m_shared->getPlayer(), factor);
}

std::string CPlaySession::finish() {
    if (m_player.joinable()) m_player.join();
    if (m_stopper.joinable()) {
        if (m_shared->m_reason.empty())
            m_stopper.join();
        else
            m_stopper.detach();
    }
    return m_shared->m_reason;
}

} // namespace host

#include "commands/Play.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "library/Failure.h"
#include "media/Arrangement.h"
#include "media/Devices.h"
#include "media/SoundFile.h"
#include "terminal/Keyboard.h"
#include "terminal/LiveLine.h"

#include <algorithm>
#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <stdexcept>
#include <system_error>
#include <thread>
#include <tonewright/host.h>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr int kPollMilliseconds = 50;

// What the player last reported; one player plays at a time.
struct SState {
    std::atomic<double> duration{0};
    std::atomic<double> position{0};
    std::atomic<int32_t> state{TONEWRIGHT_PLAYER_STOPPED};
};

void onPlayer(double duration, double position, int32_t state, void* user) {
    auto& shared = *static_cast<SState*>(user);
    shared.duration = duration;
    if (state != TONEWRIGHT_PLAYER_STOPPED) shared.position = position; // a stopped player reports 0
    shared.state = state;
}

// Shared by all threads that use the player. Stopping a player that is failing at the same time takes ten
// seconds; that thread is not waited for.
class CSession {
public:
    CSession(CLibrary& library, CHandle player) : m_library(library), m_player(std::move(player)) {
        ++s_alive;
        TONEWRIGHT_Host_SetPlayerProgress(m_player.get(), onPlayer, &m_state);
    }
    ~CSession() {
        m_player.reset();
        --s_alive;
    }
    CSession(const CSession&) = delete;
    CSession& operator=(const CSession&) = delete;

    static bool isAnyAlive() { return s_alive > 0; }

    void play() { // returns at the end
        clearFailure();
        m_failed = m_library.Player_Play(m_player.get()) != TONEWRIGHT_OK;
        if (m_failed) {
            m_reason = takeFailure("The file cannot be played");
            TONEWRIGHT_Host_SetPlayerProgress(m_player.get(), nullptr, nullptr);
        }
        m_ended = true;
    }
    const SState& getState() const { return m_state; }
    bool hasBegun() const { return m_state.state != TONEWRIGHT_PLAYER_STOPPED; }
    bool hasEnded() const { return m_ended; }
    bool hasFailed() const { return m_failed; }
    const std::string& getReason() const { return m_reason; }

    // Ignored before playback has begun.
    void togglePause() {
        if (hasBegun() && !m_ended) m_library.Player_Pause(m_player.get());
    }
    void stop() { m_library.Player_Stop(m_player.get()); } // waits for play() to end

private:
    CLibrary& m_library;
    SState m_state; // outlives the player, which reports to it
    CHandle m_player;
    std::string m_reason;
    bool m_failed = false;
    std::atomic<bool> m_ended{false}; // publishes the two above
    static inline std::atomic<int> s_alive{0};
};

class CJukebox {
public:
    CJukebox(CLibrary& library, EOutput show) : m_library(library), m_line(show, "input") {}

    // Returns at the end of the file; false when it failed.
    bool play(const fs::path& file);
    bool isStopped() const { return m_stopped || isCancelled(); }

private:
    CHandle makePlayer(const fs::path& file);
    void watch(const std::shared_ptr<CSession>& session);
    void show(const SState& state);

    CLibrary& m_library;
    CKeyboard m_keyboard;
    CLiveLine m_line;
    bool m_stopped = false; // by the q key
};

void CJukebox::show(const SState& state) {
    const bool isPaused = state.state == TONEWRIGHT_PLAYER_PAUSED;
    const double duration = state.duration, position = std::min<double>(state.position, duration);
    const std::string at = formatDuration(position), all = formatDuration(duration);
    m_line.update(
        at + " / " + all + (isPaused ? "  paused" : ""), at + " of " + all,
        {{"position", position}, {"duration", duration}, {"state", isPaused ? "paused" : "playing"}});
}

// Stopping waits for the playing thread, which may take a while, so it runs on its own thread unless none can
// be created.
std::thread startStopper(const std::shared_ptr<CSession>& session) {
    try {
        return std::thread([session] { session->stop(); });
    } catch (const std::system_error&) {
        session->stop();
        return {};
    }
}

// Shows the state and handles keys until playback has ended.
void CJukebox::watch(const std::shared_ptr<CSession>& session) {
    std::thread stopper;
    while (!session->hasEnded()) {
        const char key = m_keyboard.wait(kPollMilliseconds);
        m_stopped = m_stopped || key == 'q' || key == 'Q';
        if (key == ' ') session->togglePause();
        // A stop before playback has begun would have no effect.
        const bool hasBegun = session->hasBegun();
        if (isStopped() && hasBegun && !stopper.joinable()) stopper = startStopper(session);
        if (hasBegun && m_line.isDue()) show(session->getState());
    }
    if (!stopper.joinable()) return;
    if (session->hasFailed())
        stopper.detach();
    else
        stopper.join();
}

CHandle CJukebox::makePlayer(const fs::path& file) {
    checkInput(file);
    if (!isArrangement(file)) {
        clearFailure();
        CHandle player(m_library.CreatePlayerFromURI(toURI(file).c_str()));
        if (!player) throw std::runtime_error(takeFailure("The file cannot be played", file));
        return player;
    }
    const CHandle source = openArrangement(m_library, file, SSampleFormat());
    CHandle player(m_library.CreatePlayerFromAudioSource(source.get()));
    if (!player) throw std::runtime_error(takeFailure("The file cannot be played", file));
    return player;
}

bool CJukebox::play(const fs::path& file) {
    const auto started = std::chrono::steady_clock::now();
    m_line.start(file, nlohmann::json::object());
    std::shared_ptr<CSession> session;
    try {
        session = std::make_shared<CSession>(m_library, makePlayer(file));
        std::thread thread([session] { session->play(); });
        watch(session);
        thread.join();
        if (session->hasFailed()) {
            throw std::runtime_error(asReason(session->getReason(), file));
        }
    } catch (const std::exception& failure) {
        m_line.fail(failure.what());
        return false;
    }
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - started;
    if (isStopped())
        m_line.cancel({{"position", session->getState().position.load()}});
    else
        m_line.finish(formatDuration(session->getState().duration) + " played",
                      {{"duration", session->getState().duration.load()}, {"seconds", elapsed.count()}});
    return true;
}

} // namespace

int play(CLibrary& library, const SPlayOptions& options) {
    requireOutDevice();
    bool failed = false;
    {
        CJukebox jukebox(library, options.show);
        for (const fs::path& file : options.files) {
            failed = !jukebox.play(file) || failed;
            if (jukebox.isStopped()) break;
        }
    }
    const int code = isCancelled() ? kExitCancelled : failed ? kExitFailure : kExitSuccess;
    if (!CSession::isAnyAlive()) return code;
    std::fflush(nullptr);
    std::_Exit(code);
}

} // namespace host

#include "commands/Play.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "media/Devices.h"
#include "media/Download.h"
#include "media/InputContent.h"
#include "media/InputFiles.h"
#include "media/PlaySession.h"
#include "media/PlaySource.h"
#include "media/Playlist.h"
#include "terminal/Keyboard.h"
#include "terminal/LiveLine.h"

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <deque>
#include <memory>
#include <optional>
#include <random>
#include <set>
#include <stdexcept>
#include <thread>
#include <tonewright/host.h>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr int kPollMilliseconds = 50;
constexpr auto kEndPause = std::chrono::milliseconds(10);
constexpr int kVolumeStep = 5;   // percent
constexpr double kShortStep = 5; // seconds
constexpr double kLongStep = 60;
// The next item is opened once less than this is left to be heard, in seconds. The player reads 30 seconds
// ahead and must know by then what follows.
constexpr double kAhead = 45;
constexpr size_t kMostAhead = 64; // items that are open at a time, which only matters if they are short
// A device that has gone is replaced by another one only if it has played for that long, in seconds.
constexpr double kProofOfLife = 0.5;
constexpr int kDeviceAttempts = 8;
constexpr auto kDevicePause = std::chrono::milliseconds(250);

// What every device can play is tried first.
const SSampleFormat kFormats[] = {{44100, 2, 2}, {48000, 2, 2}, {44100, 1, 2}, {48000, 1, 2}};

// Counts the items that were passed: with --loop, it goes on counting when the list starts over.
using Turn = size_t;

class CJukebox {
public:
    CJukebox(CLibrary& library, const SPlayOptions& options, std::vector<SPlayItem> items);

    void play(); // returns at the end of the list or when the user stops it
    bool hasFailed() const { return m_hasFailed; }

private:
    enum class ERequest { none, next, previous, stop };

    // An item of the running session, by the player's index.
    struct SPlaying {
        Turn turn;
        double duration;
        std::shared_ptr<CPlayResult> result;
        std::shared_ptr<CWebStream> stream;
    };
    struct SMissing {
        Turn turn;
        std::string reason;
    };

    const SPlayItem& itemOf(Turn turn) const { return m_items[turn % m_items.size()]; }
    bool hasItem(Turn turn) const;
    std::optional<Turn> playFrom(Turn turn, double seconds);
    bool openSession(double seconds);
    std::optional<SPlaySource> openNext(const SSampleFormat& format);
    void enqueueAhead();
    void run();
    void stopStreams();
    void handleKey(int key);
    void hear(size_t index);
    std::optional<Turn> conclude();
    Turn findBefore(Turn turn) const;
    std::optional<Turn> replaceDevice(const std::string& reason);
    void reportMissing(Turn before);
    void begin();
    void end(bool isWhole);
    void show();
    nlohmann::json describeItem(Turn turn) const;
    double getVolume() const { return m_isMuted ? 0 : m_volume / 100.0; }

    CLibrary& m_library;
    const SPlayOptions& m_options;
    const std::vector<SPlayItem> m_items;
    CKeyboard m_keyboard;
    CLiveLine m_line;
    std::string m_device; // id; empty for the default device
    int m_volume;         // percent
    bool m_isMuted = false;
    bool m_hasFailed = false;

    // Of the running session
    std::unique_ptr<CPlaySession> m_session;
    SSampleFormat m_format;
    std::deque<SPlaying> m_playing;
    std::deque<SMissing> m_missing; // items that could not be opened, until their turn has come
    Turn m_next = 0;                // the next item to be opened
    size_t m_heard = 0;             // index into m_playing
    double m_from = 0;              // where the first item starts, in seconds
    ERequest m_request = ERequest::none;
    std::chrono::steady_clock::time_point m_begun;
    size_t m_barren = 0;    // items in succession that could not be opened
    std::set<size_t> m_bad; // indices of items that could not be opened
};

CJukebox::CJukebox(CLibrary& library, const SPlayOptions& options, std::vector<SPlayItem> items)
    : m_library(library), m_options(options), m_items(std::move(items)), m_line(options.show, "input"),
      m_volume(options.volume) {
    if (!options.device.empty()) m_device = findOutDevice(options.device).id;
}

bool CJukebox::hasItem(Turn turn) const {
    return turn < m_items.size() || (m_options.loops && m_barren < m_items.size());
}

nlohmann::json CJukebox::describeItem(Turn turn) const {
    const SPlayItem& item = itemOf(turn);
    nlohmann::json details = {{"index", turn % m_items.size() + 1}, {"count", m_items.size()}};
    if (!item.title.empty()) details["title"] = item.title;
    if (item.track > 0) details["track"] = item.track;
    if (item.file != item.name) details["file"] = item.file.native();
    return details;
}

// The names of a cue sheet's tracks are shown with their states.
std::string describeTrack(const SPlayItem& item) {
    if (item.track == 0) return {};
    if (item.title.empty())
        return tr("host.Play.track", "track %NUMBER%, ", {{"%NUMBER%", std::to_string(item.track)}});
    return tr("host.Play.titledTrack", "track %NUMBER% %TITLE%, ",
              {{"%NUMBER%", std::to_string(item.track)}, {"%TITLE%", toPrintable(item.title)}});
}

void CJukebox::play() {
    std::optional<Turn> turn = 0;
    double seconds = m_options.start;
    while (turn && !isCancelled()) {
        turn = playFrom(*turn, seconds);
        seconds = m_from;
    }
}

// Plays from that item on until the end, a key or a failure. Returns where to go on; m_from is the time.
std::optional<Turn> CJukebox::playFrom(Turn turn, double seconds) {
    m_playing.clear();
    m_missing.clear();
    m_heard = 0;
    m_request = ERequest::none;
    m_next = turn;
    const bool isOpen = openSession(seconds);
    reportMissing(isOpen ? m_playing.front().turn : m_next);
    if (!isOpen) return std::nullopt;
    run();
    return conclude();
}

// Opens the next item that can be opened. Empty at the end of the list.
std::optional<SPlaySource> CJukebox::openNext(const SSampleFormat& format) {
    while (hasItem(m_next) && !isCancelled()) {
        const Turn turn = m_next++;
        try {
            SPlaySource opened = openPlaySource(m_library, itemOf(turn), format);
            m_barren = 0;
            m_playing.push_back({turn, opened.duration, opened.result, opened.stream});
            return opened;
        } catch (const std::exception& failure) {
            ++m_barren;
            m_bad.insert(turn % m_items.size());
            m_missing.push_back({turn, failure.what()});
        }
    }
    return std::nullopt;
}

// False if nothing is left to play. Throws CNoDevice.
bool CJukebox::openSession(double seconds) {
    std::string reason;
    const Turn first = m_next;
    for (const SSampleFormat& format : kFormats) {
        m_next = first;
        m_missing.clear();
        m_playing.clear();
        const std::optional<SPlaySource> opened = openNext(format);
        if (!opened) return false;
        try {
            m_session = std::make_unique<CPlaySession>(m_library, opened->source, m_device);
        } catch (const std::runtime_error& failure) {
            if (reason.empty()) reason = failure.what();
            if (readDevices(TONEWRIGHT_DEVICE_OUTPUT).empty()) break;
            continue;
        }
        m_format = format;
        m_session->setVolume(getVolume());
        // A time that was meant for an item which cannot be played does not apply to the next one.
        m_from = m_playing.front().turn == first && !opened->stream ? seconds : 0;
        enqueueAhead();
        m_session->start(m_from);
        return true;
    }
    findDefaultOutDevice();
    throw CNoDevice(reason);
}

void CJukebox::enqueueAhead() {
    // What follows a stream waits for its end.
    const auto isOpenEnded = [](const SPlaying& playing) {
        return playing.stream && playing.result->getLength() < 0;
    };
    if (isOpenEnded(m_playing.back())) return;
    double left = m_playing[m_heard].duration - m_session->getState().position;
    for (size_t i = m_heard + 1; i < m_playing.size(); ++i) left += m_playing[i].duration;
    while (left < kAhead && m_playing.size() - m_heard < kMostAhead) {
        const std::optional<SPlaySource> opened = openNext(m_format);
        if (!opened) return;
        if (!m_session->enqueue(opened->source)) { // the player is failing, and its end follows
            m_next = m_playing.back().turn;
            m_playing.pop_back();
            return;
        }
        if (isOpenEnded(m_playing.back())) return;
        left += opened->duration;
    }
}

void CJukebox::handleKey(int key) {
    const double position = m_session->getState().position;
    const auto changeVolume = [this](int step) {
        m_volume = std::clamp(m_volume + step, 0, kMostVolume);
        m_isMuted = false;
        m_session->setVolume(getVolume());
    };
    // Streams cannot seek.
    const auto seek = [this](double seconds) {
        if (!m_playing[m_heard].stream) m_session->seek(std::max(seconds, 0.0));
    };
    switch (key) {
    case ' ':
        return m_session->togglePause();
    case 'q':
    case 'Q':
        m_request = ERequest::stop;
        return;
    case 'n':
    case '>':
        m_request = ERequest::next;
        return;
    case 'p':
    case '<':
        m_request = ERequest::previous;
        return;
    case kKeyLeft:
        return seek(position - kShortStep);
    case kKeyRight:
        return seek(position + kShortStep);
    case kKeyDown:
    case kKeyShiftLeft:
        return seek(position - kLongStep);
    case kKeyUp:
    case kKeyShiftRight:
        return seek(position + kLongStep);
    case '+':
    case '=':
    case '0':
        return changeVolume(kVolumeStep);
    case '-':
    case '9':
        return changeVolume(-kVolumeStep);
    case 'm':
    case 'M':
        m_isMuted = !m_isMuted;
        return m_session->setVolume(getVolume());
    default:
        return;
    }
}

// Shows the state and handles keys until the session has ended.
void CJukebox::run() {
    begin();
    while (!m_session->hasEnded()) {
        // Keys pressed while this item ends are meant for the next one.
        if (m_request != ERequest::none)
            std::this_thread::sleep_for(kEndPause);
        else if (const int key = m_keyboard.waitForKey(kPollMilliseconds); key != 0)
            handleKey(key);
        if (isCancelled()) m_request = ERequest::stop;
        hear(static_cast<size_t>(m_session->getIndex()));
        if (m_request != ERequest::none) {
            m_session->stop();
            stopStreams();
            continue;
        }
        enqueueAhead();
        // The player would wait for the stated end of the last item if that has ended early.
        const double length = m_playing[m_heard].result->getLength();
        if (m_heard + 1 == m_playing.size() && length >= 0 && m_session->getState().position >= length)
            m_request = ERequest::next;
        if (m_session->hasBegun() && m_line.isDue()) show();
    }
}

// The player's thread may be waiting for one of them.
void CJukebox::stopStreams() {
    for (const SPlaying& playing : m_playing)
        if (playing.stream) playing.stream->stop();
}

// Reports what has ended and what has begun since.
void CJukebox::hear(size_t index) {
    for (index = std::min(index, m_playing.size() - 1); m_heard < index;) {
        end(true);
        ++m_heard;
        m_from = 0;
        reportMissing(m_playing[m_heard].turn);
        begin();
    }
}

void CJukebox::reportMissing(Turn before) {
    while (!m_missing.empty() && m_missing.front().turn < before) {
        const SMissing missing = m_missing.front();
        m_missing.pop_front();
        m_line.start(itemOf(missing.turn).name, describeItem(missing.turn));
        m_line.fail(missing.reason);
        m_hasFailed = true;
    }
}

void CJukebox::begin() {
    m_begun = std::chrono::steady_clock::now();
    const Turn turn = m_playing[m_heard].turn;
    nlohmann::json details = describeItem(turn);
    if (m_from > 0) details["position"] = m_from;
    m_line.start(itemOf(turn).name, details);
}

// `isWhole`: the item was heard to its end.
void CJukebox::end(bool isWhole) {
    const SPlaying& playing = m_playing[m_heard];
    const std::string track = describeTrack(itemOf(playing.turn));
    const double duration = playing.stream ? playing.result->getLength() : playing.duration;
    if (isWhole && playing.result->getLength() >= 0 && !playing.result->getFailure().empty()) {
        m_line.fail(track + playing.result->getFailure());
        m_hasFailed = true;
    } else if (isWhole) {
        const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - m_begun;
        m_line.finish(
            track + tr("host.Play.played", "%DURATION% played", {{"%DURATION%", formatDuration(duration)}}),
            {{"duration", duration}, {"seconds", elapsed.count()}});
    } else {
        m_line.cancel({{"position", m_session->getState().position}});
    }
}

// Where to go on after the session has ended.
std::optional<Turn> CJukebox::conclude() {
    const std::string reason = m_session->finish();
    hear(static_cast<size_t>(m_session->getIndex()));
    const Turn turn = m_playing[m_heard].turn;
    if (!reason.empty() && m_request == ERequest::none) return replaceDevice(reason);
    const double length = m_playing[m_heard].result->getLength();
    const bool isWhole = m_request == ERequest::none || (m_request == ERequest::next && length >= 0 &&
                                                         m_session->getState().position >= length);
    end(isWhole);
    m_session.reset();
    m_from = 0;
    if (m_request == ERequest::stop) return std::nullopt;
    return m_request == ERequest::previous ? findBefore(turn) : turn + 1;
}

// The item before that can be played, otherwise the same one.
Turn CJukebox::findBefore(Turn turn) const {
    for (Turn before = turn; before-- > 0;)
        if (m_bad.count(before % m_items.size()) == 0) return before;
    return turn;
}

// The sound system may need a moment to choose another device.
std::optional<Turn> CJukebox::replaceDevice(const std::string& reason) {
    const Turn turn = m_playing[m_heard].turn;
    const double position = m_session->getState().position;
    const bool hasPlayed = m_session->hasBegun() && position >= m_from + kProofOfLife;
    m_session.reset();
    m_device.clear();
    for (int i = 0; hasPlayed && i < kDeviceAttempts && !isCancelled(); ++i) {
        if (i > 0) std::this_thread::sleep_for(kDevicePause);
        try {
            const SDevice device = findDefaultOutDevice();
            m_line.fail(tr("host.Play.otherDevice", "%REASON%; going on with '%NAME%'",
                           {{"%REASON%", reason}, {"%NAME%", device.name}}));
            m_from = position;
            return turn;
        } catch (const CNoDevice&) {
            // Perhaps the next time.
        }
    }
    m_line.fail(reason);
    m_hasFailed = true;
    return std::nullopt;
}

void CJukebox::show() {
    const CPlaySession::SState state = m_session->getState();
    const SPlaying& playing = m_playing[m_heard];
    // A duration of 0 is an unknown one.
    const double position =
        playing.duration > 0 ? std::min(state.position, playing.duration) : state.position;
    const std::string at = formatDuration(position), all = formatDuration(playing.duration);
    std::string live = describeTrack(itemOf(playing.turn)) + at + (playing.stream ? "" : " / " + all);
    if (m_items.size() > 1)
        live +=
            "  " + std::to_string(playing.turn % m_items.size() + 1) + "/" + std::to_string(m_items.size());
    if (m_isMuted)
        live += "  " + tr("host.Play.muted", "muted");
    else if (m_volume != 100)
        live +=
            "  " + tr("host.Play.volume", "volume %PERCENT% %", {{"%PERCENT%", std::to_string(m_volume)}});
    nlohmann::json details = {{"position", position},
                              {"duration", playing.duration},
                              {"state", state.isPaused ? "paused" : "playing"},
                              {"volume", m_volume}};
    if (m_isMuted) details["muted"] = true;
    m_line.update(live + (state.isPaused ? "  " + tr("host.Play.paused", "paused") : ""),
                  playing.stream ? at
                                 : tr("host.Play.position", "%POSITION% of %DURATION%",
                                      {{"%POSITION%", at}, {"%DURATION%", all}}),
                  details);
}

// Copies files on web servers before anything plays: the player reads every item several times. The copies
// live as long as the result. What has no stated length is read while it plays.
std::vector<std::unique_ptr<CInputContent>> fetchItems(std::vector<SPlayItem>& items) {
    std::vector<std::unique_ptr<CInputContent>> copies;
    for (SPlayItem& item : items) {
        if (!item.failure.empty() || !isWebAddress(item.file) || isCancelled()) continue;
        try {
            item.isStream = isEndless(item.file);
            if (item.isStream) continue;
            copies.push_back(std::make_unique<CInputContent>(item.file));
            item.file = copies.back()->getPath();
        } catch (const std::exception& failure) {
            item.failure = failure.what();
        }
    }
    return copies;
}

} // namespace

int play(CLibrary& library, const SPlayOptions& options) {
    requireOutDevice();
    std::vector<SPlayItem> items =
        listItems(options.inputs, listReadExtensions(library), options.isRecursive);
    const std::vector<std::unique_ptr<CInputContent>> copies = fetchItems(items);
    if (isCancelled()) return kExitCancelled;
    if (options.isShuffled) std::shuffle(items.begin(), items.end(), std::mt19937(std::random_device()()));
    bool failed = false;
    {
        CJukebox jukebox(library, options, std::move(items));
        jukebox.play();
        failed = jukebox.hasFailed();
    }
    const int code = isCancelled() ? kExitCancelled : failed ? kExitFailure : kExitSuccess;
    if (!CPlaySession::isAnyAlive()) return code;
    std::fflush(nullptr);
    std::_Exit(code);
}

} // namespace host

#include "sonora2/tracks/Tracklist.h"

#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "sonora2/context/LoggedCall.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/tracks/TrackCommands.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace sonora2::common {

namespace {

constexpr uint32_t kNever = std::numeric_limits<uint32_t>::max();

uint32_t clampFrame(double frame) {
    if (!(frame > 0.0)) return 0;
    return frame >= static_cast<double>(kNever - 1) ? kNever - 1 : static_cast<uint32_t>(frame);
}

} // namespace

CTracklist::CTracklist(int framerateNum, int framerateDen, int sortIndex, bool openInThread,
                       double fixedDuration, const P<ILogManager>& log)
    : m_framerateNum(framerateNum), m_framerateDen(framerateDen), m_sortIndex(sortIndex),
      m_openInThread(openInThread), m_fixedDuration(fixedDuration), m_log(log),
      m_lock(peru::getMutexFactory()->createMutex()), m_opener(peru::make<CTrackOpener>(log)) {
    if (framerateNum <= 0 || framerateDen <= 0)
        throw CSonoraError(
            peru::format({"sonora2.CTracklist.frame", "CTracklist: %d / %d seconds are no frame"},
                         framerateNum, framerateDen));
}

CTracklist::~CTracklist() {
    closeTracks();
}

void CTracklist::SLane::moveTo(size_t index) {
    cursor = index;
    start = isDone() ? kNever : current().start;
    end = isDone() ? kNever : current().end;
}

uint32_t CTracklist::toFrame(double seconds) const {
    return clampFrame(std::round(seconds * m_framerateDen / m_framerateNum));
}

double CTracklist::toSeconds(uint32_t frame) const {
    return static_cast<double>(frame) * m_framerateNum / m_framerateDen;
}

uint32_t CTracklist::getFrameOfPosition() {
    const double ms = static_cast<double>(getPositionMs());
    return clampFrame(std::round(ms * m_framerateDen / m_framerateNum / 1000.0));
}

void CTracklist::addTrack(const P<ITrack>& track, double start, double end) {
    if (!track) throw peru::CInvalidArgError("track", "CTracklist::addTrack");
    auto entry = std::make_unique<SEntry>(SEntry{toFrame(start), toFrame(end), track});
    const int sortIndex = track->getSortIndex();

    peru::CMutexLock lock(m_lock);
    auto lane = std::lower_bound(m_lanes.begin(), m_lanes.end(), sortIndex,
                                 [](const SLane& l, int index) { return l.sortIndex < index; });
    if (lane == m_lanes.end() || lane->sortIndex != sortIndex)
        lane = m_lanes.insert(lane, SLane{sortIndex, 0, kNever, kNever, {}});
    auto place = std::upper_bound(lane->entries.begin(), lane->entries.end(), entry->start,
                                  [](uint32_t frame, const auto& e) { return frame < e->start; });
    m_maxFrame = std::max(m_maxFrame, entry->end);
    lane->entries.insert(place, std::move(entry));
    lane->moveTo(0);
}

double CTracklist::getDuration() {
    peru::CMutexLock lock(m_lock);
    return toSeconds(m_maxFrame);
}

uint32_t CTracklist::getCurrentFrame() {
    peru::CMutexLock lock(m_lock);
    return m_currentFrame;
}

int CTracklist::getBufferStatus() {
    peru::CMutexLock lock(m_lock);
    int status = 100;
    for (const SEntry* entry : m_held)
        if (entry->start < m_currentFrame && m_currentFrame < entry->end && entry->state == EState::playing)
            status = std::min(status, entry->track->getBufferStatus());
    return status;
}

void CTracklist::processCommand(const P<ITrackCommand>& command) {
    if (command->getCommandName()->equals(CSkipToTimeCommand::kName)) {
        const P<CSkipToTimeCommand> skip(command);
        peru::CMutexLock lock(m_lock);
        skipTo(skip->getTime() - m_fixedDuration);
        return;
    }
    // Sent without the lock: a track that is being opened blocks until that is done.
    std::vector<P<ITrack>> tracks;
    {
        peru::CMutexLock lock(m_lock);
        for (const SLane& lane : m_lanes)
            for (const auto& entry : lane.entries) tracks.push_back(entry->track);
    }
    for (const P<ITrack>& track : tracks) track->processCommand(command);
}

void CTracklist::skipToFrame(uint32_t frame) {
    peru::CMutexLock lock(m_lock);
    skipTo(toSeconds(frame));
}

void CTracklist::skipTo(double time) {
    if (!(time > 0.0)) time = 0.0;
    if (time < toSeconds(m_currentFrame))
        for (SLane& lane : m_lanes) lane.moveTo(0);
    m_currentFrame = toFrame(time);
    setPosition(time);

    // A playing track that starts at or after the new time is restarted, whatever rounding does to the time.
    for (SEntry* entry : Entries(m_held))
        if (entry->state == EState::playing && entry->start >= m_currentFrame) leave(*entry);
    findActive();
    // Tracks opened for another time must not still be open when they become due.
    const double target = getLookAheadEnd();
    for (SEntry* entry : Entries(m_held)) {
        if (std::find(m_active.begin(), m_active.end(), entry) != m_active.end()) continue;
        const bool isDue = entry->end >= m_currentFrame && entry->start < target;
        if (entry->state == EState::playing || !isDue) leave(*entry);
    }
    openActive();
    const P<ITrackCommand> skip = peru::make<CSkipToTimeCommand>(time);
    for (SEntry* entry : m_active) entry->track->processCommand(skip);
}

bool CTracklist::hasMore() {
    peru::CMutexLock lock(m_lock);
    return getFrameOfPosition() <= m_maxFrame;
}

bool CTracklist::step() {
    peru::CMutexLock lock(m_lock);
    m_currentFrame = getFrameOfPosition();
    findActive();
    if (m_currentFrame > m_maxFrame) return false;
    openActive();
    mix(m_active);
    if (m_openInThread) lookAhead();
    return true;
}

void CTracklist::findActive() {
    m_active.clear();
    for (SLane& lane : m_lanes) {
        while (lane.end < m_currentFrame && !lane.isDone()) {
            leave(lane.current());
            lane.moveTo(lane.cursor + 1);
        }
        if (lane.start > m_currentFrame || lane.isDone()) continue;
        if (lane.current().track->isEnabled()) m_active.push_back(&lane.current());
    }
}

void CTracklist::openActive() {
    for (SEntry* entry : m_active) {
        if (entry->state != EState::playing) {
            if (entry->state == EState::closed) m_held.push_back(entry);
            entry->state = EState::playing;
            if (m_opener->claim(entry->track)) closeEntry(*entry);
        }
        if (!entry->track->isOpened()) entry->track->open();
    }
}

double CTracklist::getLookAheadEnd() const {
    return m_currentFrame + kLookAheadSeconds * m_framerateDen / m_framerateNum;
}

void CTracklist::lookAhead() {
    const double target = getLookAheadEnd();
    const auto alreadyHeld = static_cast<Entries::difference_type>(m_held.size());
    for (const SLane& lane : m_lanes) {
        if (lane.start >= target) continue;
        for (size_t i = lane.cursor; i < lane.entries.size() && lane.entries[i]->start < target; ++i) {
            SEntry& entry = *lane.entries[i];
            const bool isDue = entry.start > m_currentFrame && entry.end >= entry.start;
            if (!isDue || entry.state != EState::closed || !entry.track->isEnabled()) continue;
            entry.state = EState::requested;
            m_held.push_back(&entry);
        }
    }
    // Opened in the order in which they are due, across lanes: after a skip many slow media may be requested.
    std::stable_sort(m_held.begin() + alreadyHeld, m_held.end(),
                     [](const SEntry* a, const SEntry* b) { return a->start < b->start; });
    for (auto entry = m_held.begin() + alreadyHeld; entry != m_held.end(); ++entry)
        m_opener->requestOpen((*entry)->track);
}

void CTracklist::leave(SEntry& entry) {
    if (entry.state == EState::closed) return;
    entry.state = EState::closed;
    std::erase(m_held, &entry);
    if (m_openInThread)
        m_opener->requestClose(entry.track);
    else
        closeEntry(entry);
}

// A medium that fails to close must not interrupt playback.
void CTracklist::closeEntry(SEntry& entry) noexcept {
    callLogged(m_log, [&] {
        if (entry.track->isOpened()) entry.track->close();
    });
}

void CTracklist::closeTracks() {
    peru::CMutexLock lock(m_lock);
    m_opener->stop();
    for (SEntry* entry : m_held) {
        entry->state = EState::closed;
        closeEntry(*entry);
    }
    m_held.clear();
    m_active.clear();
    for (SLane& lane : m_lanes) lane.moveTo(0);
    m_currentFrame = 0;
}

} // namespace sonora2::common

#include "peru/media/PlayClock.h"

#include <algorithm>
#include <cmath>

namespace peru::media {

double CPlayClock::getPart(const SBlock& block) const {
    return std::clamp((m_now - block.time) * m_framesPerSecond, 0.0, static_cast<double>(block.frames));
}

void CPlayClock::retireFirst() {
    m_heard += static_cast<double>(m_ring[m_first].frames);
    m_first = (m_first + 1) % kMostBlocks;
    --m_count;
}

bool CPlayClock::extendLast(double time, int64_t frames) {
    if (m_count == 0) return false;
    SBlock& last = m_ring[(m_first + m_count - 1) % kMostBlocks];
    const double end = last.time + static_cast<double>(last.frames) / m_framesPerSecond;
    const double length = static_cast<double>(last.frames + frames) / m_framesPerSecond;
    if (length > kLongestBlock || std::abs(time - end) > kTremble) return false;
    last.frames += frames;
    return true;
}

void CPlayClock::add(double time, int64_t frames) {
    if (extendLast(time, frames)) return;
    if (m_count == kMostBlocks) retireFirst();
    m_ring[(m_first + m_count++) % kMostBlocks] = {time, frames};
}

double CPlayClock::getHeard(double now) {
    m_now = std::max(m_now, now);
    while (m_count > 0 && getPart(m_ring[m_first]) >= static_cast<double>(m_ring[m_first].frames))
        retireFirst();
    // Neighbouring blocks may overlap slightly, so the current block is not always the first.
    double heard = m_heard;
    for (size_t i = 0; i < m_count; ++i) heard += getPart(m_ring[(m_first + i) % kMostBlocks]);
    return heard;
}

void CPlayClock::drop(double now) {
    m_heard = getHeard(now);
    m_count = 0;
    m_now = -1e300;
}

} // namespace peru::media

#include "peru/media/PlayClock.h"

#include <algorithm>

namespace peru::media {

double CPlayClock::getPart(const SBlock& block) const {
    return std::clamp((m_now - block.time) * m_framesPerSecond, 0.0, static_cast<double>(block.frames));
}

void CPlayClock::retireFirst() {
    m_heard += static_cast<double>(m_ring[m_first].frames);
    m_first = (m_first + 1) % kMostBlocks;
    --m_count;
}

void CPlayClock::add(double time, int64_t frames) {
    if (m_count == kMostBlocks) retireFirst();
    m_ring[(m_first + m_count++) % kMostBlocks] = {time, frames};
}

double CPlayClock::getHeard(double now) {
    m_now = std::max(m_now, now);
    while (m_count > 0 && getPart(m_ring[m_first]) >= static_cast<double>(m_ring[m_first].frames))
        retireFirst();
    // The times of neighbours may overlap a little, so the running block is not always the first.
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

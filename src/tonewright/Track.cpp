#include "tonewright/Track.h"

namespace tonewright {

CTrack::CTrack() : m_modifiers(peru::make<peru::CArray>()) {}
CTrack::~CTrack() = default;

void CTrack::addModifier(const P<ITrackModifier>& modifier) {
    m_modifiers->add(modifier);
}

P<ITrackModifier> CTrack::getModifierAt(int32_t index) const {
    return P<ITrackModifier>(m_modifiers->getAt(index));
}

} // namespace tonewright

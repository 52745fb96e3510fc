#include "tonewright/TrackModifierFade.h"

namespace tonewright {

CTrackModifierFade::CTrackModifierFade(double timestamp, double startValue, double endValue, double duration)
    : m_timestamp(timestamp), m_startValue(startValue), m_endValue(endValue), m_duration(duration) {}

CTrackModifierFade::~CTrackModifierFade() = default;

} // namespace tonewright

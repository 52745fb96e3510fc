// A gain that moves from one value to another.
#pragma once

#include "peru/Object.h"
#include "tonewright/ITrackModifier.h"

namespace tonewright {

class CTrackModifierFade : public peru::CObject, public ITrackModifier {
public:
    CTrackModifierFade(double timestamp, double startValue, double endValue, double duration);
    ~CTrackModifierFade() override;

    double getTimestamp() const override { return m_timestamp; }
    double getStartValue() const { return m_startValue; }
    double getEndValue() const { return m_endValue; }
    double getDuration() const override { return m_duration; }

private:
    double m_timestamp;
    double m_startValue;
    double m_endValue;
    double m_duration;
};

} // namespace tonewright

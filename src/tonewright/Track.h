// A section of a medium, placed on an arrangement's time line.
#pragma once

#include "peru/collections/Array.h"
#include "peru/uri/IURI.h"
#include "tonewright/ITrackModifier.h"

namespace tonewright {

using peru::P;

// Plain data, all times in seconds. Written by one thread before any others read it.
class CTrack : public peru::CObject {
public:
    CTrack();
    ~CTrack() override;

    P<peru::IURI> getURI() const { return m_uri; }
    void setURI(const P<peru::IURI>& uri) { m_uri = uri; }
    double getSourceStartTime() const { return m_sourceStartTime; } // where the track begins in its medium
    void setSourceStartTime(double time) { m_sourceStartTime = time; }
    double getSourceEndTime() const { return m_sourceEndTime; }
    void setSourceEndTime(double time) { m_sourceEndTime = time; }
    double getTrackStart() const { return m_trackStart; } // on the time line
    void setTrackStart(double time) { m_trackStart = time; }

    double getDuration() const { return m_sourceEndTime - m_sourceStartTime; }
    double getTrackEnd() const { return getDuration() + m_trackStart; }

    void addModifier(const P<ITrackModifier>& modifier);
    int32_t getModifierCount() const { return m_modifiers->getCount(); }
    P<ITrackModifier> getModifierAt(int32_t index) const; // throws CInvalidArgError outside the list

private:
    P<peru::IURI> m_uri;
    double m_sourceStartTime = 0.0;
    double m_sourceEndTime = 0.0;
    double m_trackStart = 0.0;
    P<peru::CArray> m_modifiers;
};

} // namespace tonewright

// What changes the sound of a track for a while.
#pragma once

#include "peru/IBase.h"

namespace tonewright {

class ITrackModifier : public virtual peru::IBase {
public:
    virtual double getTimestamp() const = 0; // seconds from where the track begins in its medium
    virtual double getDuration() const = 0;  // seconds
};

} // namespace tonewright

// Changes the sound of a track for part of its length.
#pragma once

#include "peru/IBase.h"

namespace tonewright {

class ITrackModifier : public virtual peru::IBase {
public:
    virtual double getTimestamp() const = 0; // seconds from the track's start within its medium
    virtual double getDuration() const = 0;  // seconds
};

} // namespace tonewright

// Sound beyond full scale.
#pragma once

#include "peru/P.h"
#include "sonora2/Api.h"

namespace sonora2::common {

// A source may have it; an interface cast finds it.
class SONORA2_API IClippingPrevention : public virtual peru::IBase {
public:
    // Whether a file of floating-point samples that exceed full scale is made quieter as a whole when it is
    // delivered as integers, with a warning that states by how much. The file is then read twice. Otherwise
    // the samples clip, with a warning. An open source that is switched restarts at its start time.
    virtual void setClippingPrevention(bool prevent) = 0;
    virtual bool getClippingPrevention() = 0;
};

} // namespace sonora2::common

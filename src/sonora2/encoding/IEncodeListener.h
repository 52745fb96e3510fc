// Observes the progress of an encoding job.
#pragma once

#include "peru/P.h"
#include "sonora2/Api.h"

#include <cstdint>

namespace sonora2::common {

class SONORA2_API IEncodeListener : public virtual peru::IBase {
public:
    // Called on the encoding thread with a fraction from 0 to 1; false asks the encoder to stop.
    virtual bool onProgress(double fraction, int32_t reserved) = 0;
};

} // namespace sonora2::common

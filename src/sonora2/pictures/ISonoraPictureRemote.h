// A picture on its way through a pipe.
#pragma once

#include "sonora2/media/ISonoraPicture.h"

namespace sonora2::common {

class SONORA2_API ISonoraPictureRemote : public virtual ISonoraPicture {
public:
    virtual P<ISonoraPicture> getPicture() const = 0; // may be empty
};

} // namespace sonora2::common

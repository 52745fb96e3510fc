// Writes video.
#pragma once

#include "sonora2/plugins/ISonoraPlugin.h"

namespace sonora2::common {

class ISonoraPicture;

class SONORA2_API IVideoFormat : public virtual IFormat {
public:
    virtual ISonoraPlugin::SFormatParams getVideoParameter() = 0;
    virtual void writeFrame(const P<ISonoraPicture>& pPicture) = 0;
    virtual int getWantedImageType() = 0; // the picture kind that the format wants
};

} // namespace sonora2::common

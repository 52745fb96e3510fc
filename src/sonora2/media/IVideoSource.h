// Video from a URI.
#pragma once

#include "sonora2/media/ISource.h"

namespace sonora2::common {

class ISonoraPicture;

class SONORA2_API IVideoSource : public virtual ISource {
public:
    virtual void setMaxSize(int nWidth, int nHeight) = 0; // pixels
    virtual int getWidth() = 0;
    virtual int getHeight() = 0;
    virtual double peekNextPictureTimestamp() = 0;
    virtual P<ISonoraPicture> getNextPicture() = 0; // may be empty
    virtual int getPixelAspectNum() = 0;
    virtual int getPixelAspectDen() = 0;
    virtual double getFrameDuration() = 0;
    virtual int getFrameRateNum() = 0;
    virtual int getFrameRateDen() = 0;
};

} // namespace sonora2::common

// Pairs of pixels in the bytes Y, U, Y, V.
#pragma once

#include "sonora2/pictures/Picture.h"

namespace sonora2::common {

class SONORA2_API CYUY2Picture : public CPicture {
public:
    explicit CYUY2Picture(const P<peru::IMemoryManager>& memory, double timestamp = 0.0, int width = 0,
                          int height = 0, bool flipped = false, P<peru::IMemoryBlock> block = nullptr);
    ~CYUY2Picture() override;

    int getPictureType() const override { return kYUY2; }
    P<peru::IString> getPixelShaderName() const override;
    P<ISonoraPicture> createThumbnail() override; // its width is a multiple of 4
    static int64_t getBlockBytes(int width, int height) { return int64_t{width} * height * 2; }

protected:
    const char* getClassName() const override { return "CYUY2Picture"; }
    int getPlaneCount() const override { return 1; }
    SPlane getPlane(int plane) const override;
    int64_t getLayoutBytes(int width, int height) const override { return getBlockBytes(width, height); }
    P<CPicture> createSame(int width, int height, P<peru::IMemoryBlock> block) const override;
    void convertToRGB(uint32_t* pixels) const override;
};

} // namespace sonora2::common

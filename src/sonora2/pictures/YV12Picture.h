// Planes of Y, V and U, the latter at half the width and height.
#pragma once

#include "sonora2/pictures/Picture.h"

namespace sonora2::common {

// Plane 1 is V and plane 2 is U.
class SONORA2_API CYV12Picture : public CPicture {
public:
    explicit CYV12Picture(const P<peru::IMemoryManager>& memory, double timestamp = 0.0, int width = 0,
                          int height = 0, bool flipped = false, P<peru::IMemoryBlock> block = nullptr);
    ~CYV12Picture() override;

    int getPictureType() const override { return kYV12; }
    P<peru::IString> getPixelShaderName() const override;
    static int64_t getBlockBytes(int width, int height) { return int64_t{width} * height * 3 / 2; }

protected:
    const char* getClassName() const override { return "CYV12Picture"; }
    int getPlaneCount() const override { return 3; }
    SPlane getPlane(int plane) const override;
    int64_t getLayoutBytes(int width, int height) const override { return getBlockBytes(width, height); }
    P<CPicture> createSame(int width, int height, P<peru::IMemoryBlock> block) const override;
    void convertToRGB(uint32_t* pixels) const override;
};

} // namespace sonora2::common

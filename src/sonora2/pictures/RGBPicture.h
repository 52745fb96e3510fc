// Pixels of 32 bits: blue, green, red and 255 in the order of bytes.
#pragma once

#include "sonora2/pictures/Picture.h"

namespace sonora2::common {

class SONORA2_API CRGBPicture : public CPicture {
public:
    explicit CRGBPicture(const P<peru::IMemoryManager>& memory, double timestamp = 0.0, int width = 0,
                         int height = 0, bool flipped = false, P<peru::IMemoryBlock> block = nullptr);
    ~CRGBPicture() override;

    int getPictureType() const override { return kRGB; }
    P<peru::IString> getPixelShaderName() const override;
    static int64_t getBlockBytes(int width, int height) { return int64_t{width} * height * 4; }

protected:
    const char* getClassName() const override { return "CRGBPicture"; }
    int getPlaneCount() const override { return 1; }
    SPlane getPlane(int plane) const override;
    int64_t getLayoutBytes(int width, int height) const override { return getBlockBytes(width, height); }
    bool isRGB() const override { return true; }
    P<CPicture> createSame(int width, int height, P<peru::IMemoryBlock> block) const override;
    void convertToRGB(uint32_t* pixels) const override;
};

} // namespace sonora2::common

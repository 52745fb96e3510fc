#include "sonora2/pictures/YV12Picture.h"

#include "peru/strings/String.h"
#include "sonora2/pictures/RGBConversion.h"

#include <utility>

namespace sonora2::common {

CYV12Picture::CYV12Picture(const P<peru::IMemoryManager>& memory, double timestamp, int width, int height,
                           bool flipped, P<peru::IMemoryBlock> block)
    : CPicture(memory, timestamp, width, height, flipped, std::move(block)) {}

CYV12Picture::~CYV12Picture() = default;

P<peru::IString> CYV12Picture::getPixelShaderName() const {
    return peru::newString("yv12rgbMain");
}

CPicture::SPlane CYV12Picture::getPlane(int plane) const {
    const int64_t luma = int64_t{getWidth()} * getHeight();
    if (plane == 0) return {0, 1, 0, {16, 16}};
    return {luma + (plane - 1) * int64_t{getWidth() / 2} * (getHeight() / 2), 1, 1, {128, 128}};
}

P<CPicture> CYV12Picture::createSame(int width, int height, P<peru::IMemoryBlock> block) const {
    return peru::make<CYV12Picture>(getMemory(), getTimestamp(), width, height, isFlipped(),
                                    std::move(block));
}

void CYV12Picture::convertToRGB(uint32_t* pixels) const {
    const uint8_t* bytes = getPixels();
    convertPlanesToRGB(bytes, bytes + getPlane(2).offset, bytes + getPlane(1).offset, pixels, getWidth(),
                       getHeight());
}

} // namespace sonora2::common

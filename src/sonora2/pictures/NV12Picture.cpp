#include "sonora2/pictures/NV12Picture.h"

#include "peru/strings/String.h"
#include "sonora2/pictures/RGBConversion.h"

#include <utility>

namespace sonora2::common {

CNV12Picture::CNV12Picture(const P<peru::IMemoryManager>& memory, double timestamp, int width, int height,
                           bool flipped, P<peru::IMemoryBlock> block)
    : CPicture(memory, timestamp, width, height, flipped, std::move(block)) {}

CNV12Picture::~CNV12Picture() = default;

P<peru::IString> CNV12Picture::getPixelShaderName() const {
    return peru::newString("nv12rgbMain");
}

CPicture::SPlane CNV12Picture::getPlane(int plane) const {
    if (plane == 0) return {0, 1, 0, {16, 16}};
    return {int64_t{getWidth()} * getHeight(), 2, 1, {128, 128}};
}

P<CPicture> CNV12Picture::createSame(int width, int height, P<peru::IMemoryBlock> block) const {
    return peru::make<CNV12Picture>(getMemory(), getTimestamp(), width, height, isFlipped(),
                                    std::move(block));
}

void CNV12Picture::convertToRGB(uint32_t* pixels) const {
    const int64_t samples = int64_t{getWidth() / 2} * (getHeight() / 2);
    const P<peru::IMemoryBlock> chroma = getMemory()->getBlock(2 * samples);
    uint8_t *u = chroma->getData(), *v = u + samples;
    splitChroma(getPixels() + getPlane(1).offset, u, v, static_cast<size_t>(samples));
    convertPlanesToRGB(getPixels(), u, v, pixels, getWidth(), getHeight());
}

} // namespace sonora2::common

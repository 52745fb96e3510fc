#include "sonora2/pictures/YUY2Picture.h"

#include "peru/strings/String.h"
#include "sonora2/pictures/RGBConversion.h"

#include <utility>

namespace sonora2::common {

CYUY2Picture::CYUY2Picture(const P<peru::IMemoryManager>& memory, double timestamp, int width, int height,
                           bool flipped, P<peru::IMemoryBlock> block)
    : CPicture(memory, timestamp, width, height, flipped, std::move(block)) {}

CYUY2Picture::~CYUY2Picture() = default;

P<peru::IString> CYUY2Picture::getPixelShaderName() const {
    return peru::newString("yuy2rgbMain");
}

CPicture::SPlane CYUY2Picture::getPlane(int) const {
    return {0, 2, 0, {16, 128}};
}

P<CPicture> CYUY2Picture::createSame(int width, int height, P<peru::IMemoryBlock> block) const {
    return peru::make<CYUY2Picture>(getMemory(), getTimestamp(), width, height, isFlipped(),
                                    std::move(block));
}

P<ISonoraPicture> CYUY2Picture::createThumbnail() {
    const uint8_t* pixels = getPixels();
    P<CYUY2Picture> thumbnail(createEmptySame(getWidth() / 16 * 4, getHeight() / 4));
    if (thumbnail->getWidth() == 0) return thumbnail; // it may state any number of rows
    uint8_t* to = thumbnail->getPixels();
    const int64_t pitch = getPitch(getPlane(0));
    for (int y = 0; y < thumbnail->getHeight(); ++y) {
        const uint8_t* from = pixels + int64_t{y} * 4 * pitch;
        for (int x = 0; x < thumbnail->getWidth(); x += 2, from += 16, to += 4) {
            to[0] = from[0];
            to[1] = from[1];
            to[2] = from[8];
            to[3] = from[3];
        }
    }
    return thumbnail;
}

void CYUY2Picture::convertToRGB(uint32_t* pixels) const {
    const int64_t count = int64_t{getWidth()} * getHeight();
    const size_t pairs = static_cast<size_t>(count / 2);
    const uint8_t* bytes = getPixels();
    convertPairsToRGB(bytes, pixels, pairs);
    if (count % 2 == 0) return;
    const uint8_t last[] = {bytes[4 * pairs], bytes[4 * pairs + 1], bytes[4 * pairs], 128};
    uint32_t converted[2];
    convertPairsToRGB(last, converted, 1);
    pixels[2 * pairs] = converted[0];
}

} // namespace sonora2::common

#include "sonora2/pictures/RGBPicture.h"

#include "peru/strings/String.h"

#include <utility>

namespace sonora2::common {

CRGBPicture::CRGBPicture(const P<peru::IMemoryManager>& memory, double timestamp, int width, int height,
                         bool flipped, P<peru::IMemoryBlock> block)
    : CPicture(memory, timestamp, width, height, flipped, std::move(block)) {}

CRGBPicture::~CRGBPicture() = default;

P<peru::IString> CRGBPicture::getPixelShaderName() const {
    return peru::CString::empty();
}

CPicture::SPlane CRGBPicture::getPlane(int) const {
    return {0, 4, 0, {}};
}

P<CPicture> CRGBPicture::createSame(int width, int height, P<peru::IMemoryBlock> block) const {
    return peru::make<CRGBPicture>(getMemory(), getTimestamp(), width, height, isFlipped(), std::move(block));
}

// Never needed: the picture is its own RGB form.
void CRGBPicture::convertToRGB(uint32_t*) const {}

} // namespace sonora2::common

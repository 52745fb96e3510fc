// Arbitrary bytes as an animation: all frames, and again from the first one.
#include "Chunks.h"
#include "graphics/animation/IAnimation.h"
#include "peru/Errors.h"
#include "peru/gui/ImageLimits.h"

using namespace graphics::animation;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    peru::gui::setMaximalPixels(20'000);
    const bool isGif = size > 0 && data[0] == 'G';
    try {
        const auto animation = OpenAnimation(isGif ? std::string(reinterpret_cast<const char*>(data), size)
                                                   : repairChecksums(data, size));
        const int count = std::min(animation->GetFrameCount(), 20);
        for (int i = 0; i < count; ++i) animation->GetFrame(i);
        animation->GetFrame(0);
    } catch (const peru::CException&) {
    }
    return 0;
}

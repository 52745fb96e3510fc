#include "graphics/animation/GifAnimation.h"
#include "graphics/animation/MngAnimation.h"
#include "peru/Errors.h"
#include "peru/gui/ImageHeader.h"
#include "peru/strings/IStringLocalizer.h"

namespace graphics::animation {

P<IAnimation> OpenAnimation(std::string bytes) {
    if (peru::gui::readGifSize(bytes)) return peru::make<CGifAnimation>(std::move(bytes));
    if (peru::gui::readMngSize(bytes)) return peru::make<CMngAnimation>(std::move(bytes));
    throw peru::CError(
        peru::localize("graphics.animation.Unknown", "The file is neither a GIF nor an MNG picture."));
}

} // namespace graphics::animation

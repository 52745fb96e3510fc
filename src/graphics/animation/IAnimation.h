// Pictures that change over time.
#pragma once

#include "graphics/Api.h"
#include "peru/Object.h"
#include "peru/gui/RGBAImage.h"

#include <string>

namespace graphics::animation {

using peru::P;

// The frames of a file, composed when they are asked for: an animation keeps its file and one or two pictures
// in memory, however many frames there are. Not thread-safe.
class GRAPHICS_API IAnimation : public virtual peru::IBase {
protected:
    ~IAnimation() override = default;

public:
    virtual int GetWidth() const = 0;
    virtual int GetHeight() const = 0;
    // At least 1. Throws CError if the file is damaged. For MNG, the first call of this operation or the next
    // one composes all frames.
    virtual int GetFrameCount() = 0;
    // How long a frame is shown, in milliseconds; may be 0. Throws CError as above, and CInvalidArgError if
    // there is no such frame.
    virtual int GetDuration(int frame) = 0;
    // How often the animation is played: 0 for ever.
    virtual int GetLoopCount() const = 0;
    // The whole picture as it is shown during the frame. The next frame costs the composition of one frame,
    // an earlier one that of all frames up to it. Throws CError if the frame is damaged.
    virtual peru::gui::CRGBAImage GetFrame(int frame) = 0;
};

// From the content of a GIF or MNG file. Throws CError if the bytes are neither, if the structure is damaged,
// or if a picture is above the limit.
GRAPHICS_API P<IAnimation> OpenAnimation(std::string bytes);

} // namespace graphics::animation

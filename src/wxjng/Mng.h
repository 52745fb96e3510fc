// MNG: pictures and animations.
#pragma once

#include "peru/gui/RGBAImage.h"

#include <memory>
#include <string>
#include <string_view>
#include <vector>

class wxImage;

namespace wxjng {

// Composes the frames of an animation one after the other; a plain picture has one. Throws CError if the file
// is damaged or above a limit; the memory that decoding takes is limited as well.
class GRAPHICS_API CMngReader {
public:
    explicit CMngReader(std::string_view bytes);
    ~CMngReader();
    CMngReader(const CMngReader&) = delete;
    CMngReader& operator=(const CMngReader&) = delete;

    int getWidth() const;
    int getHeight() const;
    // How often the animation is played: 0 for ever.
    int getLoops() const;
    // Composes the next frame. False at the end.
    bool next();
    // Of the current frame, transparent where nothing was painted. Valid until next().
    const peru::gui::CRGBAImage& getImage() const;
    // How long the current frame is shown, in milliseconds.
    int getDuration() const;

private:
    class CImpl;
    const std::unique_ptr<CImpl> m_impl;
};

struct SMngFrame {
    const wxImage& image;
    int milliseconds;
};

// All frames have the same size. `loops` as above. A duration of 0 becomes the shortest one, since frames
// without duration are not shown. Throws CError.
GRAPHICS_API std::string encodeMng(const std::vector<SMngFrame>& frames, int loops);

} // namespace wxjng

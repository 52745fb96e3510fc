// Animations of GIF files.
#pragma once

#include "graphics/animation/GifFile.h"
#include "graphics/animation/IAnimation.h"

namespace graphics::animation {

class CGifAnimation : public peru::CObject, public IAnimation {
public:
    // Throws CError.
    explicit CGifAnimation(std::string bytes);
    ~CGifAnimation() override = default;

    int GetWidth() const override { return m_file.width; }
    int GetHeight() const override { return m_file.height; }
    int GetFrameCount() override { return static_cast<int>(m_file.frames.size()); }
    int GetDuration(int frame) override { return getFrame(frame).milliseconds; }
    int GetLoopCount() const override { return m_file.loops; }
    peru::gui::CRGBAImage GetFrame(int frame) override;

private:
    const SGifFrame& getFrame(int frame) const;
    // The picture without the last frame, as its disposal says.
    void dispose();
    void paint(const SGifFrame& frame);

    const std::string m_bytes; // the file refers to them
    const SGifFile m_file;
    int m_current = -1; // the frame that the picture shows
    peru::gui::CRGBAImage m_picture;
    peru::gui::CRGBAImage m_saved; // the picture below the current frame if that is restored
};

} // namespace graphics::animation

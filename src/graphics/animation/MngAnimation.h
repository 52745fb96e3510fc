// Animations of MNG files.
#pragma once

#include "graphics/animation/IAnimation.h"
#include "wxjng/Mng.h"

namespace graphics::animation {

class CMngAnimation : public peru::CObject, public IAnimation {
public:
    // Throws CError.
    explicit CMngAnimation(std::string bytes);
    ~CMngAnimation() override = default;

    int GetWidth() const override { return m_reader->getWidth(); }
    int GetHeight() const override { return m_reader->getHeight(); }
    int GetFrameCount() override { return static_cast<int>(getDurations().size()); }
    int GetDuration(int frame) override;
    int GetLoopCount() const override { return m_reader->getLoops(); }
    peru::gui::CRGBAImage GetFrame(int frame) override;

private:
    const std::vector<int>& getDurations();

    const std::string m_bytes;
    std::unique_ptr<wxjng::CMngReader> m_reader;
    int m_current = -1;           // the frame that the reader shows
    std::vector<int> m_durations; // empty until they are needed
};

} // namespace graphics::animation

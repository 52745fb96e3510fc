#include "graphics/animation/MngAnimation.h"

#include "peru/Errors.h"
#include "peru/gui/ImageLimits.h"
#include "wxjng/Chunks.h"

namespace graphics::animation {

namespace {

// A few bytes can make any number of large frames. Counting the frames stops at this many times the pixels of
// the largest picture.
constexpr int64_t kMaximalPictures = 64;

} // namespace

CMngAnimation::CMngAnimation(std::string bytes)
    : m_bytes(std::move(bytes)), m_reader(std::make_unique<wxjng::CMngReader>(m_bytes)) {}

const std::vector<int>& CMngAnimation::getDurations() {
    if (!m_durations.empty()) return m_durations;
    wxjng::CMngReader reader(m_bytes);
    const int64_t pixels = int64_t{reader.getWidth()} * reader.getHeight();
    int64_t room = kMaximalPictures * peru::gui::getMaximalPixels();
    std::vector<int> durations;
    for (; reader.next(); room -= pixels) {
        if (room < 0) wxjng::failDamaged("mng");
        durations.push_back(reader.getDuration());
    }
    if (durations.empty()) wxjng::failDamaged("mng");
    return m_durations = std::move(durations);
}

int CMngAnimation::GetDuration(int frame) {
    if (frame < 0 || frame >= GetFrameCount()) throw peru::CInvalidArgError("frame", "CMngAnimation");
    return m_durations[static_cast<size_t>(frame)];
}

peru::gui::CRGBAImage CMngAnimation::GetFrame(int frame) {
    if (frame < 0) throw peru::CInvalidArgError("frame", "CMngAnimation");
    if (frame < m_current) {
        m_reader = std::make_unique<wxjng::CMngReader>(m_bytes);
        m_current = -1;
    }
    for (; m_current < frame; ++m_current)
        if (!m_reader->next()) {
            const bool hasFrames = m_current >= 0;
            m_reader = std::make_unique<wxjng::CMngReader>(m_bytes);
            m_current = -1;
            if (!hasFrames) wxjng::failDamaged("mng");
            throw peru::CInvalidArgError("frame", "CMngAnimation");
        }
    return m_reader->getImage();
}

} // namespace graphics::animation

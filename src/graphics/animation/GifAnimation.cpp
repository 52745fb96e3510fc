#include "graphics/animation/GifAnimation.h"

#include "graphics/animation/Lzw.h"
#include "peru/Errors.h"
#include "wxjng/Chunks.h"

#include <numeric>

namespace graphics::animation {

namespace {

// Where the rows of the compressed pixels belong.
std::vector<int> getRows(const SGifFrame& frame) {
    std::vector<int> rows;
    if (!frame.isInterlaced) {
        rows.resize(static_cast<size_t>(frame.height));
        std::iota(rows.begin(), rows.end(), 0);
        return rows;
    }
    for (const auto& [first, step] : {std::pair(0, 8), {4, 8}, {2, 4}, {1, 2}})
        for (int row = first; row < frame.height; row += step) rows.push_back(row);
    return rows;
}

} // namespace

CGifAnimation::CGifAnimation(std::string bytes)
    : m_bytes(std::move(bytes)), m_file(parseGif(m_bytes)), m_picture(m_file.width, m_file.height) {}

const SGifFrame& CGifAnimation::getFrame(int frame) const {
    if (frame < 0 || frame >= static_cast<int>(m_file.frames.size()))
        throw peru::CInvalidArgError("frame", "CGifAnimation");
    return m_file.frames[static_cast<size_t>(frame)];
}

peru::gui::CRGBAImage CGifAnimation::GetFrame(int frame) {
    getFrame(frame);
    if (frame < m_current) {
        m_picture = {m_file.width, m_file.height};
        m_current = -1;
    }
    for (; m_current < frame; ++m_current) {
        dispose();
        const SGifFrame& next = getFrame(m_current + 1);
        if (next.disposal == EDisposal::restore) m_saved = m_picture;
        try {
            paint(next);
        } catch (...) {
            m_picture = {m_file.width, m_file.height}; // start again at the next call
            m_current = -1;
            throw;
        }
    }
    return m_picture;
}

void CGifAnimation::dispose() {
    if (m_current < 0) return;
    const SGifFrame& last = getFrame(m_current);
    if (last.disposal == EDisposal::restore) m_picture = std::move(m_saved);
    if (last.disposal != EDisposal::clear) return;
    const int right = std::min(last.left + last.width, m_file.width);
    const int bottom = std::min(last.top + last.height, m_file.height);
    for (int y = last.top; y < bottom; ++y)
        for (int x = last.left; x < right; ++x) m_picture.getRow(y)[x] = 0;
}

void CGifAnimation::paint(const SGifFrame& frame) {
    if (frame.palette.empty()) wxjng::failDamaged("gif");
    const auto frameWidth = static_cast<size_t>(frame.width);
    const std::vector<uint8_t> indices =
        decodeLzw(frame.blocks, frame.bits, frameWidth * static_cast<size_t>(frame.height));
    const std::vector<int> rows = getRows(frame);
    const int width = std::min(frame.width, m_file.width - frame.left);
    const auto byteAt = [&](size_t i) { return uint32_t{static_cast<uint8_t>(frame.palette[i])}; };
    for (size_t i = 0; i < rows.size() && width > 0; ++i) {
        const int y = frame.top + rows[i];
        if (y >= m_file.height) continue;
        uint32_t* const to = m_picture.getRow(y) + frame.left;
        for (int x = 0; x < width; ++x) {
            const int index = indices[i * frameWidth + static_cast<size_t>(x)];
            if (index == frame.transparent) continue;
            // Indices above the palette are its first colour.
            const size_t colour =
                static_cast<size_t>(3 * index) < frame.palette.size() ? static_cast<size_t>(3 * index) : 0;
            to[x] = 0xFF000000u | byteAt(colour) << 16 | byteAt(colour + 1) << 8 | byteAt(colour + 2);
        }
    }
}

} // namespace graphics::animation

#include "graphics/animation/GifFile.h"

#include "peru/gui/ImageLimits.h"
#include "wxjng/Chunks.h"

#include <algorithm>
#include <utility>

namespace graphics::animation {

namespace {

class CParser {
public:
    explicit CParser(std::string_view bytes) : m_bytes(bytes) {}

    SGifFile parse() {
        skip(6); // the signature, which the caller knows
        m_file.width = readNumber();
        m_file.height = readNumber();
        peru::gui::checkImageSize(m_file.width, m_file.height);
        const int flags = readByte();
        skip(2);
        m_palette = skip(getPaletteSize(flags));
        constexpr int kExtension = 0x21, kPicture = 0x2C, kEnd = 0x3B;
        while (m_at < m_bytes.size() || m_file.frames.empty()) {
            const int kind = readByte();
            if (kind == kEnd) break;
            if (kind == kExtension)
                readExtension();
            else if (kind == kPicture)
                readPicture();
            else
                wxjng::failDamaged("gif");
        }
        if (m_file.frames.empty()) wxjng::failDamaged("gif");
        return std::move(m_file);
    }

private:
    static size_t getPaletteSize(int flags) { return flags & 0x80 ? size_t{3} << ((flags & 7) + 1) : 0; }

    std::string_view skip(size_t count) {
        if (count > m_bytes.size() - m_at) wxjng::failDamaged("gif");
        m_at += count;
        return m_bytes.substr(m_at - count, count);
    }

    int readByte() { return static_cast<uint8_t>(skip(1)[0]); }

    int readNumber() {
        const int low = readByte();
        return low | readByte() << 8;
    }

    // The first block of a sequence up to an empty one.
    std::string_view skipBlocks() {
        std::string_view first;
        for (bool isFirst = true;; isFirst = false) {
            const std::string_view block = skip(static_cast<size_t>(readByte()));
            if (isFirst) first = block;
            if (block.empty()) return first;
        }
    }

    void readExtension() {
        constexpr int kControl = 0xF9, kApplication = 0xFF;
        const int label = readByte();
        const size_t content = m_at;
        const std::string_view first = skipBlocks();
        if (label == kControl && first.size() == 4) {
            const auto byteAt = [&](size_t index) { return static_cast<uint8_t>(first[index]); };
            m_control.milliseconds = 10 * (byteAt(1) | byteAt(2) << 8);
            const int method = byteAt(0) >> 2 & 7;
            m_control.disposal = method == 2   ? EDisposal::clear
                                 : method == 3 ? EDisposal::restore
                                               : EDisposal::keep;
            m_control.transparent = byteAt(0) & 1 ? byteAt(3) : -1;
        }
        // A block with the number 1 and how often the animation is repeated.
        constexpr size_t kName = 11;
        if (label != kApplication || (first != "NETSCAPE2.0" && first != "ANIMEXTS1.0")) return;
        const size_t at = content + 1 + kName;
        if (m_at < at + 4 || m_bytes[at] != 3 || m_bytes[at + 1] != 1) return;
        const int repetitions = static_cast<uint8_t>(m_bytes[at + 2]) | static_cast<uint8_t>(m_bytes[at + 3])
                                                                            << 8;
        m_file.loops = repetitions == 0 ? 0 : repetitions + 1;
    }

    void readPicture() {
        SGifFrame frame = std::exchange(m_control, {});
        frame.left = readNumber();
        frame.top = readNumber();
        frame.width = readNumber();
        frame.height = readNumber();
        peru::gui::checkImageSize(frame.width, frame.height);
        const int flags = readByte();
        frame.isInterlaced = (flags & 0x40) != 0;
        const std::string_view palette = skip(getPaletteSize(flags));
        frame.palette = palette.empty() ? m_palette : palette;
        frame.bits = readByte();
        const size_t begin = m_at;
        skipBlocks();
        frame.blocks = m_bytes.substr(begin, m_at - begin);
        m_file.frames.push_back(frame);
    }

    const std::string_view m_bytes;
    size_t m_at = 0;
    SGifFile m_file;
    std::string_view m_palette; // of frames without one
    SGifFrame m_control;        // for the next frame
};

} // namespace

SGifFile parseGif(std::string_view bytes) {
    return CParser(bytes).parse();
}

} // namespace graphics::animation

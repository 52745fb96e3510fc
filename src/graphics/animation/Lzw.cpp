#include "graphics/animation/Lzw.h"

#include "wxjng/Chunks.h"

#include <array>

namespace graphics::animation {

namespace {

constexpr int kMaximalWidth = 12; // of a code
constexpr int kMaximalCodes = 1 << kMaximalWidth;

class CCodeReader {
public:
    explicit CCodeReader(std::string_view blocks) : m_blocks(blocks) {}

    int read(int width) {
        while (m_bitCount < width) {
            m_bits |= readByte() << m_bitCount;
            m_bitCount += 8;
        }
        const auto code = static_cast<int>(m_bits & ((1u << width) - 1));
        m_bits >>= width;
        m_bitCount -= width;
        return code;
    }

private:
    uint32_t readByte() {
        if (m_left == 0) {
            m_left = next();
            if (m_left == 0) wxjng::failDamaged("gif");
        }
        --m_left;
        return next();
    }

    uint32_t next() {
        if (m_at >= m_blocks.size()) wxjng::failDamaged("gif");
        return static_cast<uint8_t>(m_blocks[m_at++]);
    }

    const std::string_view m_blocks;
    size_t m_at = 0;
    uint32_t m_left = 0; // bytes of the current block
    uint32_t m_bits = 0;
    int m_bitCount = 0;
};

} // namespace

std::vector<uint8_t> decodeLzw(std::string_view blocks, int bits, size_t count) {
    if (bits < 1 || bits > 8) wxjng::failDamaged("gif");
    const int clear = 1 << bits, end = clear + 1;
    // A code stands for the values of its prefix, which is a smaller code, and one more value.
    std::array<uint16_t, kMaximalCodes> prefixes;
    std::array<uint8_t, kMaximalCodes> lasts, reversed;
    CCodeReader reader(blocks);
    std::vector<uint8_t> values;
    values.reserve(count);
    int width = bits + 1, next = end + 1, previous = -1;
    uint8_t first = 0;
    while (values.size() < count) {
        const int code = reader.read(width);
        if (code == clear) {
            width = bits + 1;
            next = end + 1;
            previous = -1;
            continue;
        }
        if (code == end || code > next || (previous < 0 && code > clear)) wxjng::failDamaged("gif");
        size_t length = 0;
        int at = code;
        if (code == next) { // the code that is about to be defined: the previous one and its first value
            reversed[length++] = first;
            at = previous;
        }
        for (; at >= clear; at = prefixes[static_cast<size_t>(at)])
            reversed[length++] = lasts[static_cast<size_t>(at)];
        first = static_cast<uint8_t>(at);
        values.push_back(first);
        while (length > 0 && values.size() < count) values.push_back(reversed[--length]);
        if (previous >= 0 && next < kMaximalCodes) {
            prefixes[static_cast<size_t>(next)] = static_cast<uint16_t>(previous);
            lasts[static_cast<size_t>(next)] = first;
            ++next;
            if (next == 1 << width && width < kMaximalWidth) ++width;
        }
        previous = code;
    }
    return values;
}

} // namespace graphics::animation

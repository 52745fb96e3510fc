// The iteration engine of strings.
#pragma once

#include "peru/strings/ICharEncoding.h"

#include <algorithm>

namespace peru {

// Runs over encoded text, decoding 16 characters at a time into an array on the stack, so that a scan
// allocates nothing and pays one virtual call per 16 characters. Malformed bytes are skipped.
class CStringWindow {
public:
    enum EDirection { forward, backward };

    // Forward from `pos` up to `size`, or backward from `pos` (the position after the first character to
    // read) down to 0. `count` limits the characters, -1 for unlimited.
    CStringWindow(const ICharEncoding& encoding, const uint8_t* data, int32_t size, int32_t pos,
                  EDirection direction = forward, int32_t count = -1)
        : m_encoding(encoding), m_data(data), m_size(size), m_pos(pos), m_left(count),
          m_direction(direction) {}

    // Returns false at the end and then leaves `ch` unchanged.
    bool next(char32_t& ch) {
        if (m_used == m_filled && !fill()) return false;
        ch = m_chars[m_used++];
        return true;
    }
    // Byte offset of the character that next() returned last.
    int32_t getOffset() const { return m_offsets[m_used - 1]; }

private:
    static constexpr int32_t kSize = 16;

    bool fill() {
        if (m_pos < 0 || m_left == 0) return false;
        int32_t wanted = m_left < 0 ? kSize : std::min(m_left, kSize);
        m_used = 0;
        m_filled = 0;
        m_pos =
            m_direction == forward
                ? m_encoding.decodeChars(m_chars, wanted, m_filled, m_data, m_size, m_pos, m_offsets)
                : m_encoding.decodeCharsBackward(m_chars, wanted, m_filled, m_data, m_size, m_pos, m_offsets);
        if (m_left > 0) m_left -= m_filled;
        return m_filled > 0;
    }

    const ICharEncoding& m_encoding;
    const uint8_t* m_data;
    int32_t m_size;
    int32_t m_pos; // -1 at the end
    int32_t m_left;
    EDirection m_direction;
    int32_t m_filled = 0;
    int32_t m_used = 0;
    char32_t m_chars[kSize];
    int32_t m_offsets[kSize];
};

} // namespace peru

// Consecutive numbers.
#pragma once

#include <cstdint>

namespace graphics {

class CIdGenerator {
public:
    // The first number is 0.
    int64_t GetNext() { return m_next++; }

private:
    int64_t m_next = 0;
};

} // namespace graphics

// Random numbers.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"

#include <cstdint>
#include <random>

namespace peru {

// For unique names and shuffling; not for secrets. Thread-safe.
class PERU_API CMersenneTwisterRandomNumberGenerator : public CObject {
public:
    explicit CMersenneTwisterRandomNumberGenerator(uint32_t seed);
    ~CMersenneTwisterRandomNumberGenerator() override;

    uint32_t getNext();
    // Uniformly distributed from 0 to `bound` - 1. Throws CInvalidArgError for 0.
    uint32_t getNextBelow(uint32_t bound);

private:
    P<IMutex> m_mutex; // guards the generator
    std::mt19937 m_generator;
};

// The process-wide generator, seeded by the system.
PERU_API P<CMersenneTwisterRandomNumberGenerator> getRandomNumberGenerator();

} // namespace peru

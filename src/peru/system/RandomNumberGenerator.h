// Random numbers.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"

#include <cstdint>
#include <random>

namespace peru {

// Numbers for names and shuffles; not for secrets. Safe from any thread.
class PERU_API CMersenneTwisterRandomNumberGenerator : public CObject {
public:
    explicit CMersenneTwisterRandomNumberGenerator(uint32_t seed);
    ~CMersenneTwisterRandomNumberGenerator() override;

    uint32_t getNext();
    // From 0 to `bound` - 1, each as likely as the others. Throws CInvalidArgError for 0.
    uint32_t getNextBelow(uint32_t bound);

private:
    P<IMutex> m_mutex; // guards the generator
    std::mt19937 m_generator;
};

// The process's own, seeded by the system.
PERU_API P<CMersenneTwisterRandomNumberGenerator> getRandomNumberGenerator();

} // namespace peru

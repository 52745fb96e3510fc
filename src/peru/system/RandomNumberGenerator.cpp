#include "peru/system/RandomNumberGenerator.h"

#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"

namespace peru {

CMersenneTwisterRandomNumberGenerator::CMersenneTwisterRandomNumberGenerator(uint32_t seed)
    : m_mutex(getMutexFactory()->createMutex()), m_generator(seed) {}

CMersenneTwisterRandomNumberGenerator::~CMersenneTwisterRandomNumberGenerator() = default;

uint32_t CMersenneTwisterRandomNumberGenerator::getNext() {
    CMutexLock lock(m_mutex);
    return static_cast<uint32_t>(m_generator());
}

uint32_t CMersenneTwisterRandomNumberGenerator::getNextBelow(uint32_t bound) {
    if (bound == 0) throw CInvalidArgError("bound", "CMersenneTwisterRandomNumberGenerator::getNextBelow");
    CMutexLock lock(m_mutex);
    return std::uniform_int_distribution<uint32_t>(0, bound - 1)(m_generator);
}

P<CMersenneTwisterRandomNumberGenerator> getRandomNumberGenerator() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<CMersenneTwisterRandomNumberGenerator>(
        key, [] { return make<CMersenneTwisterRandomNumberGenerator>(std::random_device()()); });
}

} // namespace peru

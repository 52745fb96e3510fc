#include "peru/system/RandomNumberGenerator.h"
#include "peru/Errors.h"

#include <array>
#include <gtest/gtest.h>

namespace {

using namespace peru;

// The published check value of the generator: the 10000th number from its default seed.
TEST(RandomNumberGenerator, FollowsThePublishedSequence) {
    const auto generator = make<CMersenneTwisterRandomNumberGenerator>(5489u);
    for (int i = 1; i < 10000; ++i) generator->getNext();
    EXPECT_EQ(generator->getNext(), 4123659995u);
}

TEST(RandomNumberGenerator, SpreadsEvenlyBelowTheBound) {
    const auto generator = make<CMersenneTwisterRandomNumberGenerator>(1u);
    std::array<int, 3> counts{};
    for (int i = 0; i < 3000; ++i) ++counts.at(generator->getNextBelow(3));
    for (int count : counts) EXPECT_NEAR(count, 1000, 150);
    EXPECT_THROW(generator->getNextBelow(0), CInvalidArgError);
}

} // namespace

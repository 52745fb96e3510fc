#include "peru/system/RandomNumberGenerator.h"
#include "peru/Errors.h"

#include <gtest/gtest.h>

namespace {

using namespace peru;

// The published check value of the generator: the 10000th number from its default seed.
TEST(RandomNumberGenerator, FollowsThePublishedSequence) {
    const auto generator = make<CMersenneTwisterRandomNumberGenerator>(5489u);
    for (int i = 1; i < 10000; ++i) generator->getNext();
    EXPECT_EQ(generator->getNext(), 4123659995u);
    for (int i = 0; i < 100; ++i) EXPECT_LT(generator->getNextBelow(3), 3u);
    EXPECT_THROW(generator->getNextBelow(0), CInvalidArgError);
}

} // namespace

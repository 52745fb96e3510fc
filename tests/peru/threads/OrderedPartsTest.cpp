#include "peru/threads/OrderedParts.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <random>
#include <stdexcept>
#include <thread>
#include <vector>

namespace {

using namespace peru;

TEST(OrderedParts, Parts_AreDeliveredInOrderAndWithinTheWindow) {
    std::mt19937 random(11);
    for (int round = 0; round < 60; ++round) {
        SOrderedParts parts;
        parts.count = random() % 40;
        parts.window = random() % 9 + 1;
        parts.helpers = static_cast<int>(random() % 8);
        enum class EEnd { none, stop, failure };
        const auto end = static_cast<EEnd>(round % 3);
        const size_t last = parts.count > 0 ? random() % parts.count : 0; // where the end comes
        std::vector<std::atomic<int>> busy(static_cast<size_t>(parts.helpers) + 1), runs(parts.count);
        std::vector<size_t> slots(parts.window, SIZE_MAX);
        std::atomic<bool> isRight{true};
        parts.work = [&, pauses = random() % 20](size_t part, int worker) {
            if (busy[static_cast<size_t>(worker)]++ > 0 || runs[part]++ > 0) isRight = false;
            for (size_t i = 0; i < part * pauses % 30; ++i) std::this_thread::yield();
            slots[part % parts.window] = part; // a part outside of the window overwrites another one
            --busy[static_cast<size_t>(worker)];
        };
        size_t delivered = 0;
        parts.deliver = [&](size_t part) {
            if (part != delivered++ || slots[part % parts.window] != part) isRight = false;
            if (part < last || end == EEnd::none) return true;
            if (end == EEnd::failure) throw std::runtime_error("full");
            return false;
        };
        SCOPED_TRACE(round);
        if (end == EEnd::failure && parts.count > 0) {
            EXPECT_THROW(runInOrder(parts), std::runtime_error);
        } else {
            EXPECT_EQ(end == EEnd::none || parts.count == 0, runInOrder(parts));
        }
        EXPECT_EQ(end == EEnd::none ? parts.count : std::min(last + 1, parts.count), delivered);
        EXPECT_TRUE(isRight);
        EXPECT_TRUE(std::all_of(busy.begin(), busy.end(), [](int count) { return count == 0; }));
    }
}

TEST(OrderedParts, IdleThreads_LeaveTheBudgetToOthers) {
    const int limit = getThreadBudget().getLimit();
    getThreadBudget().setLimit(4);
    {
        const CThreadShare own;
        const CIdleThreads first(2), second(5), third(1);
        EXPECT_EQ(2, first.getCount());
        EXPECT_EQ(1, second.getCount());
        EXPECT_EQ(0, third.getCount());
    }
    EXPECT_EQ(4, CIdleThreads(9).getCount());
    getThreadBudget().setLimit(limit);
}

} // namespace

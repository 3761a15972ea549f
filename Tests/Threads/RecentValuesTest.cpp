#include "Threads/RecentValues.h"

#include <gtest/gtest.h>

#include <thread>

using Corvo::DSP::RecentValues;

namespace {

struct Pair {
    std::uint32_t first, second;
};

}  // namespace

TEST(RecentValues, KeepsTheNewest) {
    RecentValues<Pair, 8> values;
    std::vector<Pair> taken;
    for (std::uint32_t i = 0; i < 20; ++i) values.Push({i, i});
    values.Take(taken);
    ASSERT_EQ(taken.size(), 8u);
    EXPECT_EQ(taken.front().first, 12u);
    values.Push({20, 20});
    values.Take(taken);
    EXPECT_EQ(taken.back().first, 20u);
    EXPECT_EQ(taken.size(), 9u);
}

// Catches values that are half of one and half of another, or out of order. Under the thread sanitizer:
// races.
TEST(RecentValues, NeverGivesOneHalfWritten) {
    constexpr std::uint32_t kLast = 200000;
    RecentValues<Pair, 4> values;
    std::thread writer([&] {
        for (std::uint32_t i = 1; i <= kLast; ++i) values.Push({i, ~i});
    });
    std::uint32_t before = 0;
    std::vector<Pair> taken;
    while (before < kLast) {
        taken.clear();
        values.Take(taken);
        for (const auto& [first, second] : taken) {
            ASSERT_EQ(second, ~first);
            ASSERT_GT(first, before);
            before = first;
        }
    }
    writer.join();
}

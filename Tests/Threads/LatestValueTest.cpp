#include "Threads/LatestValue.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <thread>

using Corvo::DSP::LatestValue;

TEST(LatestValue, GivesTheNewestOnce) {
    LatestValue<int> slot;
    EXPECT_EQ(slot.Take(), nullptr);
    for (const int value : {1, 2, 3}) {
        slot.Draft() = value;
        slot.Publish();
    }
    const int* taken = slot.Take();
    ASSERT_NE(taken, nullptr);
    EXPECT_EQ(*taken, 3);
    EXPECT_EQ(slot.Take(), nullptr);
    slot.Draft() = 4;
    slot.Publish();
    slot.Draft() = 5;
    EXPECT_EQ(*taken, 3) << "what was taken stays while the writer goes on";
    EXPECT_EQ(*slot.Take(), 4);
}

// Catches a slot that both threads have at once: a value half written, an old one after a new one.
TEST(LatestValue, KeepsTheThreadsApart) {
    constexpr int kLast = 20000;
    LatestValue<std::array<int, 64>> slot;
    const std::jthread writer([&] {
        for (int value = 1; value <= kLast; ++value) {
            slot.Draft().fill(value);
            slot.Publish();
        }
    });
    for (int newest = 0; newest < kLast;) {
        const auto* taken = slot.Take();
        if (!taken) {
            std::this_thread::yield();
            continue;
        }
        ASSERT_TRUE(std::ranges::all_of(*taken, [&](int value) { return value == taken->front(); }));
        ASSERT_GT(taken->front(), newest);
        newest = taken->front();
    }
}

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <memory>
#include <thread>

#include "Threads/LatestValue.h"
#include "Threads/RecentValues.h"

// Values on their way from one thread to another.

using Corvo::DSP::LatestValue;
using Corvo::DSP::RecentValues;

TEST(LatestValue, GivesTheNewestOnce) {
    LatestValue<int> slot;
    EXPECT_EQ(slot.Take(), nullptr);
    for (const int value : {1, 2, 3}) {
        slot.Draft() = value;
        slot.Publish();
    }
    ASSERT_NE(slot.Take(), nullptr);
    EXPECT_EQ(slot.Take(), nullptr);
    slot.Draft() = 4;
    slot.Publish();
    slot.Draft() = 5;
    EXPECT_EQ(slot.Taken(), 3) << "what was taken stays while the writer goes on";
    EXPECT_EQ(*slot.Take(), 4);
}

// Catches a slot that both threads have at once: a value half written, an old one after a new one, one that
// is freed on the reader's thread or never.
TEST(LatestValue, KeepsTheThreadsApart) {
    struct Owned {
        std::array<int, 64> values{};
        std::thread::id owner = std::this_thread::get_id();
        ~Owned() { EXPECT_EQ(owner, std::this_thread::get_id()); }
    };
    constexpr int kLast = 20000;
    LatestValue<std::unique_ptr<Owned>> slot;
    std::jthread writer([&] {
        for (int value = 1; value <= kLast; ++value) {
            slot.Draft() = std::make_unique<Owned>();
            slot.Draft()->values.fill(value);
            slot.Publish();
        }
        slot.Draft().reset();
    });
    for (int newest = 0; newest < kLast;) {
        const auto* taken = slot.Take();
        if (!taken) {
            std::this_thread::yield();
            continue;
        }
        const auto& values = (*taken)->values;
        ASSERT_TRUE(std::ranges::all_of(values, [&](int value) { return value == values.front(); }));
        ASSERT_GT(values.front(), newest);
        newest = values.front();
    }
    writer.join();
    // What is left goes with this thread: the one taken and the one that came back for it.
    for (int i = 0; i < 2; ++i, slot.Publish())
        for (auto* rest : {&slot.Draft(), &slot.Taken()})
            if (*rest) (*rest)->owner = std::this_thread::get_id();
}

using Two = std::array<std::uint32_t, 2>;

TEST(RecentValues, KeepsTheNewest) {
    RecentValues<Two, 8> values;
    std::vector<Two> taken;
    for (std::uint32_t i = 0; i < 20; ++i) values.Push({i, i});
    values.Take(taken);
    ASSERT_EQ(taken.size(), 8u);
    EXPECT_EQ(taken.front()[0], 12u);
    values.Push({20, 20});
    values.Take(taken);
    EXPECT_EQ(taken.back()[0], 20u);
    EXPECT_EQ(taken.size(), 9u);
}

// Catches values that are half of one and half of another, or out of order. Under the thread sanitizer:
// races.
TEST(RecentValues, NeverGivesOneHalfWritten) {
    constexpr std::uint32_t kLast = 200000;
    RecentValues<Two, 4> values;
    std::thread writer([&] {
        for (std::uint32_t i = 1; i <= kLast; ++i) values.Push({i, ~i});
    });
    std::uint32_t before = 0;
    std::vector<Two> taken;
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

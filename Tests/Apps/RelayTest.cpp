#include <gtest/gtest.h>

#include <stdexcept>

#include "Relay.h"

namespace dsphost {
namespace {

constexpr int kBlocks = 1000;

void Fill(Relay& relay, int blocks) {
    for (int i = 0; i < blocks; ++i) {
        Block* const block = relay.ToFill();
        if (!block) return;
        block->samples[0] = i;
        relay.Pass();
    }
}

void ExpectBlocks(Relay& relay, int blocks) {
    for (int i = 0; i < blocks; ++i) {
        const Block* const block = relay.ToTake();
        ASSERT_TRUE(block) << i;
        ASSERT_EQ(block->samples[0], i);
        relay.Return();
    }
}

TEST(Relay, HandsOverEverythingAndThenWhatFailed) {
    Relay relay(1);
    relay.Start([&] {
        Fill(relay, kBlocks);
        throw std::runtime_error("damaged");
    });
    ExpectBlocks(relay, kBlocks);
    EXPECT_THROW(relay.ToTake(), std::runtime_error);
}

// Whoever fills must not wait for a thread that has failed, nor the relay's end for one that has no more to
// do.
TEST(Relay, LeavesNobodyWaiting) {
    Relay full(1);
    full.Start([&] {
        ExpectBlocks(full, 3);
        throw std::runtime_error("disk full");
    });
    EXPECT_THROW(Fill(full, kBlocks), std::runtime_error);
    EXPECT_THROW(full.Finish(), std::runtime_error);

    Relay taker(1), filler(1);
    taker.Start([&] { EXPECT_FALSE(taker.ToTake()); });
    filler.Start([&] { Fill(filler, kBlocks); });
}

}  // namespace
}  // namespace dsphost

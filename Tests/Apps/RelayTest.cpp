#include <gtest/gtest.h>

#include <stdexcept>

#include "Relay.h"

namespace dsphost {
namespace {

void Fill(Relay& relay) {
    while (relay.ToFill()) relay.Pass();
}

// Whoever fills must not wait for a thread that has failed, nor the relay's end for one that has no more to
// do.
TEST(Relay, LeavesNobodyWaiting) {
    Relay full(1);
    full.Start([&] {
        for (int i = 0; i < 3 && full.ToTake(); ++i) full.Return();
        throw std::runtime_error("disk full");
    });
    EXPECT_THROW(Fill(full), std::runtime_error);
    EXPECT_THROW(full.Finish(), std::runtime_error);

    Relay taker(1), filler(1);
    taker.Start([&] { EXPECT_FALSE(taker.ToTake()); });
    filler.Start([&] { Fill(filler); });
}

}  // namespace
}  // namespace dsphost

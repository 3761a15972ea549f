#include "DSP/Equalizer/AudioParameter.h"

#include <gtest/gtest.h>

#include <cmath>

namespace {

using Progress = Corvo::DSP::AudioParameterProgressAlternate;
using Managed = Corvo::DSP::AudioParameterManaged<double, Progress>;

// The whole way, recomputed with the library's exponential: catches a wrong digit in the polynomial.
TEST(AudioParameter, GlidesAsDescribedAndSnapsAtTheEnd) {
    std::int32_t counter = 0;
    Managed parameter{.value = 1.0, .target = 1.0, .counter = &counter};
    parameter.SetTarget(-1.0);
    double expected = 1.0;
    for (double rel = 2.0; !(rel < 0.01);) {
        ASSERT_EQ(counter, 1);
        rel = std::abs(expected + 1.0) / 2.0;
        const double k = rel >= 1.0 ? 0.0009 : 9e-5 * std::exp(5.0 * (1.0 - rel));
        expected = rel < 0.01 ? -1.0 : (1.0 - k) * expected - k;
        parameter.Advance();
        ASSERT_NEAR(parameter.value, expected, 1e-10);
    }
    EXPECT_EQ(parameter.value, -1.0);
    EXPECT_EQ(counter, 0);

    Managed nowhere{.value = 9e-15, .counter = &counter};
    nowhere.SetTarget(-3e-15);
    nowhere.Advance();
    EXPECT_TRUE(nowhere.value == 0.0 && !nowhere.moving) << "nothing to cover ends at once";
}

TEST(AudioParameter, ManagedFormCountsOnlyRealMoves) {
    std::int32_t counter = 0;
    Managed parameter{.counter = &counter};
    parameter.SetTarget(0.0);
    EXPECT_FALSE(parameter.moving) << "the target it had already";
    for (const double target : {1.0, 2.0}) parameter.SetTarget(target);
    EXPECT_EQ(counter, 1) << "one value on the move, however often it is sent elsewhere";
    counter = 0;
    parameter.Jump();
    EXPECT_EQ(counter, 0) << "never below 0";
    EXPECT_EQ(parameter.value, 2.0);
}

}  // namespace

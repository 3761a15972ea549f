#include "DSP/Equalizer/AudioParameter.h"

#include <gtest/gtest.h>

#include "Plain/PlainParEQ.h"

namespace {

using Corvo::DSP::AudioParameterManaged;
using Managed = AudioParameterManaged<double, Corvo::DSP::AudioParameterProgressAlternate>;

// Catches a wrong digit in the polynomial that stands for the exponential. The second way is none.
TEST(AudioParameter, GlidesLikeThePlainFormAndSnapsAtTheEnd) {
    for (const auto& [start, target] : {std::pair{1.0, -1.0}, {9e-15, -3e-15}}) {
        std::int32_t counter = 0, plainCounter = 0;
        Managed parameter{.value = start, .counter = &counter};
        AudioParameterManaged<double, Plain::ExponentialProgress> plain{.value = start,
                                                                        .counter = &plainCounter};
        parameter.SetTarget(target);
        plain.SetTarget(target);
        do {
            ASSERT_EQ(counter, 1);
            parameter.Advance();
            plain.Advance();
            ASSERT_NEAR(parameter.value, plain.value, 1e-10);
        } while (plainCounter > 0);
        EXPECT_EQ(parameter.value, start == 1.0 ? target : 0.0);
        EXPECT_EQ(counter, 0);
    }
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

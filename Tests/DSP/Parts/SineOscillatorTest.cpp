#include "DSP/Parts/SineOscillator.h"

#include <gtest/gtest.h>

using Corvo::DSP::PhaseAfter;
using Corvo::DSP::SineOscillator;

// Catches a shortcut where the sums are not rounded alike: next to powers of two, from nothing, at ties.
TEST(SineOscillator, MovesThePhaseExactlyAsSteppingDoes) {
    const double increments[] = {0.0, 1e-9, 7.85398163397448e-4,        0.003926990816987241, 0.11,
                                 3.0, -0.2, std::ldexp(1.0, -52) * 1.5, std::ldexp(3.0, -51)};
    for (const double increment : increments)
        for (const double start : {0.0, 1e-300, 0.5, 0.999, 1.9999, 3.9, 4.0, 6.28, 7.99, 12.0, -3.0})
            for (double stepped = start; const int steps : {1, 2, 3, 63, 64, 64}) {
                const double begin = stepped;
                for (int i = 0; i < steps; ++i) stepped += increment;
                ASSERT_EQ(PhaseAfter(begin, increment, steps), stepped)
                    << begin << " + " << steps << " * " << increment;
            }
}

// Catches a turn by the wrong number of increments and sines that drift.
TEST(SineOscillator, StaysOnTheLibrarysSine) {
    double sines[SineOscillator::kPiece];
    for (const double hz : {0.01, 6.0, 1000.0})
        for (const int frames : {1, 7, 64}) {
            const double increment = SineOscillator::kTwoPi * hz / 48000.0, cycle = 6.283180236816406;
            SineOscillator first, last;
            first.SetIncrement(increment);
            last.SetIncrement(increment);
            double ahead = 0.0, behind = 0.0;
            for (int block = 0; block < 200; ++block) {
                first.StepAndTakeSines(sines, frames);
                for (int i = 0; i < frames; ++i)
                    ASSERT_NEAR(sines[i], std::sin(ahead += increment), 1e-13) << hz << " Hz";
                first.ReducePhase();
                ahead = std::fmod(ahead, SineOscillator::kTwoPi);
                ASSERT_EQ(first.Phase(), ahead);

                const int taken = last.TakeSinesAndStep(sines, frames, cycle);
                ASSERT_TRUE(taken >= 1 && taken <= frames);
                for (int i = 0; i < taken; ++i) {
                    ASSERT_NEAR(sines[i], std::sin(behind), 1e-13) << hz << " Hz";
                    behind += increment;
                    if (behind >= cycle) behind -= cycle;
                }
                ASSERT_EQ(last.Phase(), behind);
            }
        }
}

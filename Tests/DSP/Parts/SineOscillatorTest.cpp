#include "DSP/Parts/SineOscillator.h"

#include <gtest/gtest.h>

using Corvo::DSP::PhaseAfter;

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

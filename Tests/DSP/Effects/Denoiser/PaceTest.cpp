#include "DSP/Effects/Denoiser/Pace.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <utility>
#include <vector>

using Corvo::DSP::Denoising::Pace;

// Catches a step that is left out, done twice, out of its order or after the last tick, and an uneven spread.
TEST(PaceTest, DoesEveryStepOnceAndEvenly) {
    Pace pace;
    const auto cost = [](int step) { return step == 3 ? 4.0 : 1.0; };
    pace.Set(96, 256, 5, 32, 8, cost);
    std::vector<std::pair<std::int64_t, int>> done;
    double most = 0.0;
    for (std::int64_t now = 0; now < 96 + 3 * 256; now += 32) {
        double tick = 0.0;
        pace.Tick(now, [&](std::int64_t job, int step) {
            EXPECT_LT(now, 96 + job * 256 + 5 * 32);
            done.emplace_back(job, step);
            tick += cost(step);
        });
        most = std::max(most, tick);
    }
    ASSERT_EQ(done.size(), 24u);
    for (std::size_t i = 0; i < done.size(); ++i)
        EXPECT_EQ(done[i], std::pair(static_cast<std::int64_t>(i / 8), static_cast<int>(i % 8)));
    EXPECT_LE(most, 5.0);
}

#include "DSP/Effects/Gain/GainKernel.h"

#include <gtest/gtest.h>

#include "Platform/Processor.h"
#include "Support/Signals.h"

// Both layouts, both kinds of register and every length of the rest behind whole registers.
TEST(GainKernel, GivesTheSameBitsInEveryRegisterAndLayout) {
    if (!Corvo::HasAvx2()) GTEST_SKIP() << "no AVX2 here";
    using namespace Corvo::DSP::GainEfx;
    const auto check = [](auto zero) {
        using Sample = decltype(zero);
        const Coefficients<Sample> c{Sample(0.7), Sample(1.3), Sample(-0.4), Sample(2.5)};
        for (int frames = 0; frames < 40; ++frames) {
            const auto size = static_cast<std::size_t>(frames);
            auto baseline = TestSupport::Noise<Sample>(2 * size), wide = baseline;
            auto left = TestSupport::Channel(wide, 0), right = TestSupport::Channel(wide, 1);
            BaselineKernels<Sample>().interleaved(baseline.data(), frames, c);
            Avx2Kernels<Sample>().interleaved(wide.data(), frames, c);
            Avx2Kernels<Sample>().planar(left.data(), right.data(), frames, c);
            ASSERT_EQ(baseline, wide);
            ASSERT_EQ(left, TestSupport::Channel(wide, 0));
            ASSERT_EQ(right, TestSupport::Channel(wide, 1));
        }
    };
    check(0.0f);
    check(0.0);
}

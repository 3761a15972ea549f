#include "DSP/Pitch/ClassicKernel.h"

#include <gtest/gtest.h>

#include <tuple>
#include <vector>

#include "Platform/Processor.h"
#include "Support/Signals.h"

// Frame after frame, with a rest behind whole registers; both directions of pitch, and silence of either
// sign.
TEST(ClassicKernel, GivesTheSameBitsInRegistersOfEveryWidth) {
    if (!Corvo::HasAvx2()) GTEST_SKIP() << "no AVX2 here";
    using namespace Corvo::DSP::ClassicPitch;
    constexpr std::size_t kBins = 133;
    const auto table = TestSupport::Noise<float>(4 * kBins, 20000.0);
    const auto window = TestSupport::Noise<double>(kBins);
    const auto run = [&](const Kernels& kernels, double over) {
        std::vector<std::int32_t> last(kBins), target(kBins);
        std::vector<float> strength(kBins), frequency(kBins), sum(kBins);
        std::vector<double> phase(kBins);
        for (const float pitch : {0.5f, 1.7f, -0.001f, 1.0f}) {
            auto input = TestSupport::Noise<float>(kBins, pitch);
            input[3] = 0.0f;
            input[4] = -0.0f;
            kernels.analyse(
                {input.data(), window.data(), table.data(), table.data() + kBins, table.data() + 2 * kBins,
                 pitch, last.data(), strength.data(), frequency.data(), target.data()},
                kBins);
            kernels.synthesise({strength.data(), frequency.data(), window.data(), 187.5, 0.7, over,
                                128 * over, phase.data(), sum.data()},
                               kBins);
        }
        return std::tuple(last, target, strength, frequency, sum, phase);
    };
    for (const double over : {3.0, 4.0}) EXPECT_EQ(run(BaselineKernels(), over), run(Avx2Kernels(), over));
}

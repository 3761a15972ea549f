#include "DSP/Effects/Tube/TubeKernel.h"

#include <gtest/gtest.h>

#include <cstring>
#include <limits>

#include "Support/Signals.h"

namespace {

using namespace Corvo::DSP;

// Noise reaches every branch and both clamps; beside it what a damaged stream may hold.
template <typename Sample>
void ExpectSameBits() {
    using Limits = std::numeric_limits<Sample>;
    constexpr int kFunctions = TubeShaping::kNoFunction + 1;
    auto input = TestSupport::Noise<Sample>(1000, 1.2);
    const Sample special[] = {Sample(0), -Sample(0), 1, -1, Limits::infinity(), Limits::quiet_NaN()};
    for (std::size_t i = 0; i < std::size(special); ++i) input[3 * i] = special[i];
    for (int both = 0; both < kFunctions * kFunctions; ++both)
        for (const std::size_t count : {1000u, 1u, 2u, 3u, 14u, 0u}) {
            const TubeShaping shaping{
                {{{both % kFunctions, 1.0f, 0.8f, 9.5f}, {both / kFunctions, 1.7f, 0.4f, 2.9f}}}};
            auto baseline = input, wide = input;
            BaselineTubeKernel<Sample>()(baseline.data(), count, shaping);
            Avx2TubeKernel<Sample>()(wide.data(), count, shaping);
            for (std::size_t i = 0; i < input.size(); ++i)
                ASSERT_TRUE(std::isnan(baseline[i]) ? std::isnan(wide[i])
                                                    : !std::memcmp(&baseline[i], &wide[i], sizeof(Sample)))
                    << "functions " << both % kFunctions << ", " << both / kFunctions << ", at " << i;
        }
}

}  // namespace

// Catches a lane, an end of block or an operation that one kind of register treats otherwise.
TEST(TubeKernelTest, WideRegistersGiveTheSameBits) {
    if (!__builtin_cpu_supports("avx2")) GTEST_SKIP() << "no AVX2 here";
    ExpectSameBits<float>();
    ExpectSameBits<double>();
}

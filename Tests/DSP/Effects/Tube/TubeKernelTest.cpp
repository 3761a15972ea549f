#include "DSP/Effects/Tube/TubeKernel.h"

#include <gtest/gtest.h>

#include <cstring>
#include <limits>

#include "Platform/Processor.h"
#include "Support/Signals.h"

namespace {

using namespace Corvo::DSP;

template <typename Sample>
class TubeKernelTest : public testing::Test {};
using Precisions = testing::Types<float, double>;
TYPED_TEST_SUITE(TubeKernelTest, Precisions);

// Catches a lane, an end of block or an operation that one kind of register treats otherwise. Noise reaches
// every branch and both clamps; beside it what a damaged stream may hold.
TYPED_TEST(TubeKernelTest, WideRegistersGiveTheSameBits) {
    if (!Corvo::HasAvx2()) GTEST_SKIP() << "no AVX2 here";
    using Limits = std::numeric_limits<TypeParam>;
    constexpr int kFunctions = TubeShaping::kNoFunction + 1;
    auto input = TestSupport::Noise<TypeParam>(1000, 1.2);
    for (const auto value : {TypeParam(0), -TypeParam(0), Limits::infinity(), Limits::quiet_NaN()})
        input.insert(input.begin() + 3, 2, value);
    for (int both = 0; both < kFunctions * kFunctions; ++both)
        for (const std::size_t count : {1000u, 1u, 2u, 3u, 14u, 0u}) {
            const TubeShaping shaping{
                {{{both % kFunctions, 1.0f, 0.8f, 9.5f}, {both / kFunctions, 1.7f, 0.4f, 2.9f}}}};
            auto baseline = input, wide = input;
            BaselineTubeKernel<TypeParam>()(baseline.data(), count, shaping);
            Avx2TubeKernel<TypeParam>()(wide.data(), count, shaping);
            for (std::size_t i = 0; i < input.size(); ++i)
                ASSERT_TRUE(std::isnan(baseline[i]) ? std::isnan(wide[i])
                                                    : !std::memcmp(&baseline[i], &wide[i], sizeof wide[i]))
                    << "functions " << both % kFunctions << ", " << both / kFunctions << ", at " << i;
        }
}

}  // namespace

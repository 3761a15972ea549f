#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>

#include "DSP/Effects/Denoiser/Pace.h"
#include "DSP/Effects/Denoiser/SpectrumKernels.h"
#include "Platform/Processor.h"
#include "Support/Signals.h"

namespace {

using namespace Corvo::DSP::Denoising;

std::vector<float> Positive(std::size_t count, std::uint64_t seed) {
    auto values = TestSupport::Noise<float>(count, 1.0, seed);
    for (auto& value : values) value = std::exp(8.0f * value);
    return values;
}

// Everything that the kernels make of the same input, one behind the other.
std::vector<float> Everything(const SpectrumKernels& kernels) {
    constexpr std::size_t kCount = 160, kHalf = 144;
    std::vector<std::vector<float>> in;
    for (std::uint64_t seed = 1; seed <= 6; ++seed) in.push_back(Positive(kCount, seed));
    const float* const frames[]{in[0].data(), in[1].data(), in[2].data()};
    const float weights[]{0.5f, 0.3f, 0.2f, 0.1f};
    std::vector<float> all, a(kCount), b(kCount), c(kCount);
    const auto keep = [&] {
        for (auto* each : {&a, &b, &c}) all.insert(all.end(), each->begin(), each->end());
    };
    kernels.multiply(a.data(), frames[0], frames[1], kCount);
    kernels.multiplyAdd(a.data(), frames[1], frames[2], kCount);
    kernels.power(frames[0], frames[1], b.data(), kHalf);
    c = in[3];
    kernels.applyGain(c.data(), in[4].data(), frames[2], kHalf);
    keep();
    for (const bool first : {true, false})
        kernels.ratio(
            {frames[0], frames[1], frames[2], in[3].data(), 0.3f, 0.5f, first, !first, a.data(), b.data()}, 0,
            kCount);
    keep();
    kernels.evidence({{frames, weights, 3}, 0.4f, 3.0f, 0.2f, a.data(), b.data(), c.data()}, 0, kCount);
    keep();
    kernels.smoothBins(in[0].data() + 16, a.data(), weights, 3, 0, 128);
    kernels.presence({{frames, weights, 2}, in[3].data(), 0.0001f, 0.7999f, b.data()}, 0, kCount);
    kernels.firstEstimate(frames[0], frames[1], frames[2], c.data(), 0, kCount);
    keep();
    kernels.gain({{frames, weights, 3}, in[3].data(), in[4].data(), in[5].data(), a.data()}, 0, kCount);
    kernels.risk(frames[0], frames[1], b.data(), 0, kCount);
    kernels.logarithm(frames[0], c.data(), kCount);
    keep();
    kernels.exponential(frames[2], a.data(), kCount);
    keep();
    all.push_back(kernels.dot(frames[0], frames[1], 99));
    auto values = in[0];
    const auto quiet = kernels.quiet(values.data(), frames[1], 99, 40);
    all.insert(all.end(), {quiet.count, quiet.sum, quiet.logSum});
    return all;
}

// Catches a lane or an operation that one kind of register treats otherwise.
TEST(SpectrumKernelsTest, WideRegistersGiveTheSameBits) {
    if (!Corvo::HasAvx2()) GTEST_SKIP() << "no AVX2 here";
    const auto baseline = Everything(BaselineSpectrumKernels()), wide = Everything(Avx2SpectrumKernels());
    ASSERT_EQ(baseline.size(), wide.size());
    EXPECT_EQ(std::memcmp(baseline.data(), wide.data(), baseline.size() * sizeof(float)), 0);
}

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

}  // namespace

#include "Spectrum/Fft/CorvoFFT.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdint>
#include <vector>

#include "Plain/PlainFft.h"
#include "Platform/AlignedMemory.h"
#include "Spectrum/Fft/FftPlan.h"
#include "Support/AudioThreadRules.h"
#include "Support/Signals.h"

namespace {

using Complex = std::complex<long double>;
using TestSupport::Noise;

template <typename T>
using Values = std::vector<T>;

template <typename T>
constexpr double kTolerance = sizeof(T) == 4 ? 1e-6 : 1e-14;

constexpr int kLengths[] = {1, 2, 4, 8, 16, 32, 64, 128, 256, 512, 1024, 2048, 4096, 32768, 65536};

template <typename T>
double RelativeError(const Values<T>& got, const std::vector<long double>& expected) {
    long double error = 0, power = 0;
    for (std::size_t i = 0; i < got.size(); ++i) {
        error += (got[i] - expected[i]) * (got[i] - expected[i]);
        power += expected[i] * expected[i];
    }
    return static_cast<double>(std::sqrt(error / power));
}

template <typename T>
std::vector<long double> PackedSpectrum(const Values<T>& samples) {
    const auto bins = Plain::Fft(std::vector<Complex>(samples.begin(), samples.end()));
    std::vector<long double> packed(samples.size());
    packed[0] = bins[0].real();
    if (packed.size() > 1) packed[1] = bins[packed.size() / 2].real();
    for (std::size_t k = 1; k < packed.size() / 2; ++k) {
        packed[2 * k] = bins[k].real();
        packed[2 * k + 1] = bins[k].imag();
    }
    return packed;
}

template <typename T>
class CorvoFFTOf : public testing::Test {};
using Precisions = testing::Types<float, double>;
TYPED_TEST_SUITE(CorvoFFTOf, Precisions);

// The reference is only as good as its own definition.
TEST(PlainFft, IsTheDefinition) {
    const auto noise = Noise<double>(32);
    const auto bins = Plain::Fft(std::vector<Complex>(noise.begin(), noise.end()));
    for (std::size_t k = 0; k < noise.size(); ++k) {
        Complex sum = 0;
        for (std::size_t n = 0; n < noise.size(); ++n)
            sum += std::polar<long double>(
                       1, -2 * std::numbers::pi_v<long double> * static_cast<long double>(k * n % 32) / 32) *
                   static_cast<long double>(noise[n]);
        EXPECT_LT(std::abs(sum - bins[k]), 1e-17L) << k;
    }
}

TYPED_TEST(CorvoFFTOf, RealTransformsAreExactAndReturn) {
    for (const int length : kLengths) {
        const auto input = Noise<TypeParam>(static_cast<std::size_t>(length));
        CorvoFFT fft;
        fft.AllocateReal(length, 1);
        auto data = input;
        fft.DoFFTReal(data.data(), 0, 0);
        EXPECT_LT(RelativeError(data, PackedSpectrum(input)), kTolerance<TypeParam>) << length;

        const auto half = static_cast<std::size_t>(length / 2);
        Values<TypeParam> re(half), im(half), back(input.size());
        fft.DoFFTReal(input.data(), re.data(), im.data(), length, 0);
        for (std::size_t k = 0; k < half; ++k) {
            ASSERT_EQ(re[k], data[2 * k]) << length << ", bin " << k;
            ASSERT_EQ(im[k], data[2 * k + 1]) << length << ", bin " << k;
        }
        fft.DoIFFTReal(data.data(), 0, 0);
        const std::vector<long double> original(input.begin(), input.end());
        EXPECT_LT(RelativeError(data, original), kTolerance<TypeParam>) << length;
        if (length > 1) {
            fft.DoIFFTReal(back.data(), re.data(), im.data(), length, 0);
            EXPECT_EQ(back, data) << length;
        }
    }
}

TYPED_TEST(CorvoFFTOf, ComplexTransformsAreExactAndReturn) {
    for (const int length : kLengths) {
        const auto input = Noise<TypeParam>(2 * static_cast<std::size_t>(length));
        std::vector<Complex> points;
        for (std::size_t i = 0; i < input.size(); i += 2) points.emplace_back(input[i], input[i + 1]);
        std::vector<long double> expected;
        for (const Complex& bin : Plain::Fft(points)) {
            expected.push_back(bin.real());
            expected.push_back(bin.imag());
        }
        CorvoFFT fft;
        fft.Allocate(length, 1);
        auto data = input;
        fft.DoFFT(data.data(), 0, 0);
        EXPECT_LT(RelativeError(data, expected), kTolerance<TypeParam>) << length;
        fft.DoIFFT(data.data(), 0, 0);
        EXPECT_LT(RelativeError(data, {input.begin(), input.end()}), kTolerance<TypeParam>) << length;
    }
}

TYPED_TEST(CorvoFFTOf, PutsConstantAndAlternatingSignalsFirst) {
    constexpr int kLength = 64;
    CorvoFFT fft;
    fft.AllocateReal(kLength, 0);
    Values<TypeParam> constant(kLength, TypeParam(0.5)), alternating(kLength, 1), expected(kLength, 0);
    for (std::size_t i = 1; i < kLength; i += 2) alternating[i] = -1;
    fft.DoFFTReal(constant.data(), 0, 0);
    fft.DoFFTReal(alternating.data(), 0, 0);
    expected[0] = kLength / 2;
    EXPECT_EQ(constant, expected);
    expected[0] = 0;
    expected[1] = kLength;
    EXPECT_EQ(alternating, expected);
}

// 1000 is taken as 512, the scratch that the split form copies from as 1000 values.
TYPED_TEST(CorvoFFTOf, RoundsOddLengthsDown) {
    CorvoFFT fft;
    fft.AllocateReal(1000, 1);
    const auto input = Noise<TypeParam>(1000);
    Values<TypeParam> data(input.begin(), input.begin() + 512);
    Values<TypeParam> re(500), im(500), beyond = input;
    fft.DoFFTReal(input.data(), re.data(), im.data(), 1000, 0);
    fft.DoFFTReal(beyond.data(), 0, 0);
    EXPECT_LT(RelativeError(Values<TypeParam>(beyond.begin(), beyond.begin() + 512), PackedSpectrum(data)),
              kTolerance<TypeParam>);
    EXPECT_TRUE(std::equal(beyond.begin() + 512, beyond.end(), input.begin() + 512));
    for (std::size_t k = 0; k < 256; ++k) ASSERT_EQ(re[k], beyond[2 * k]) << k;
}

TYPED_TEST(CorvoFFTOf, DoesNothingUnlessBuilt) {
    const auto input = Noise<TypeParam>(64);
    auto data = input, re = input, im = input;
    const auto runAll = [&](CorvoFFT& fft) {
        fft.DoFFTReal(data.data(), 0, 0);
        fft.DoIFFTReal(data.data(), 0, 0);
        fft.DoFFTReal(input.data(), re.data(), im.data(), 64, 0);
        fft.DoIFFTReal(data.data(), re.data(), im.data(), 64, 0);
        fft.DoFFT(data.data(), 0, 0);
        fft.DoIFFT(data.data(), 0, 0);
    };
    CorvoFFT fft;
    fft.Free();
    runAll(fft);
    fft.AllocateReal(0, 1);
    fft.Allocate(-5, 1);
    fft.AllocateReal(524289, 1);
    runAll(fft);
    fft.AllocateReal(64, 1);
    fft.Allocate(32, 1);
    fft.Free();
    fft.Free();
    runAll(fft);
    EXPECT_EQ(data, input);
    EXPECT_EQ(re, input);
    EXPECT_EQ(im, input);
}

TYPED_TEST(CorvoFFTOf, AllocatesNothingPerTransform) {
    if (!TestSupport::AudioThreadRules::CanCount()) GTEST_SKIP();
    CorvoFFT fft;
    fft.AllocateReal(2048, 1);
    fft.Allocate(1024, 1);
    auto data = Noise<TypeParam>(2048);
    Values<TypeParam> re(1024), im(1024);
    const TestSupport::AudioThreadRules rules;
    fft.DoFFTReal(data.data(), 0, 0);
    fft.DoIFFTReal(data.data(), 0, 0);
    fft.DoFFTReal(data.data(), re.data(), im.data(), 2048, 0);
    fft.DoIFFTReal(data.data(), re.data(), im.data(), 2048, 0);
    fft.DoFFT(data.data(), 0, 0);
    fft.DoIFFT(data.data(), 0, 0);
    EXPECT_EQ(rules.Broken(), "");
}

TEST(CorvoFFT, ReallocatesAndRebuilds) {
    CorvoFFT fft;
    void* block = fft.intelRealloc(nullptr, 100);
    ASSERT_NE(block, nullptr);
    EXPECT_EQ(reinterpret_cast<std::uintptr_t>(block) % 64, 0u);
    block = fft.intelRealloc(block, 200);
    EXPECT_EQ(fft.intelRealloc(block, -1), nullptr);

    fft.AllocateReal(65536, 1);
    fft.AllocateReal(8, 0);
    std::vector<float> data{1, 0, 0, 0, 0, 0, 0, 0, 7};
    fft.DoFFTReal(data.data(), 0, 0);
    EXPECT_EQ(data, (std::vector<float>{1, 1, 1, 0, 1, 0, 1, 0, 7}));
    fft.DoIFFTReal(data.data(), 0, 0);  // the inverse for 65536 values is gone
    EXPECT_EQ(data[0], 1.0f);
}

// The same project must sound and look the same on every machine.
TYPED_TEST(CorvoFFTOf, EveryInstructionSetGivesTheSameBits) {
    using namespace Corvo::Fft;
    using Bytes = std::vector<unsigned char, Corvo::AlignedAllocator<unsigned char>>;
    for (const Kind kind : {Kind::Real, Kind::Complex})
        for (int order = 0; order <= 13; ++order) {
            Bytes memory(PlanBytes<TypeParam>(order, kind));
            const auto& plan = *BuildPlan<TypeParam>(memory.data(), order, kind);
            Bytes work(WorkValues(plan.points) * sizeof(TypeParam));
            auto* const scratch = reinterpret_cast<TypeParam*>(work.data());
            const auto input = Noise<TypeParam>(std::max<std::size_t>(2 * plan.points, 1));
            const auto run = [&](const Kernels<TypeParam>& kernels) {
                Values<TypeParam> out(input.size()), back(input.size());
                const bool real = kind == Kind::Real;
                (real ? kernels.realForward : kernels.complexForward)(plan, input.data(), out.data(),
                                                                      scratch);
                (real ? kernels.realInverse : kernels.complexInverse)(plan, out.data(), back.data(), scratch);
                out.insert(out.end(), back.begin(), back.end());
                return out;
            };
            EXPECT_EQ(run(BestKernels<TypeParam>()), run(BaselineKernels<TypeParam>())) << order;
        }
}

}  // namespace

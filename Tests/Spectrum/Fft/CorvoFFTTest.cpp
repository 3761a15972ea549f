#include "Spectrum/Fft/CorvoFFT.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
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

constexpr int kLengths[] = {1, 2, 4, 8, 16, 32, 64, 128, 256, 512, 2048, 4096, 32768};

// The difference from `expected` as a share of it.
template <typename T>
double Error(const Values<T>& got, const Values<long double>& expected) {
    long double error = 0, power = 0;
    for (std::size_t i = 0; i < expected.size(); ++i) {
        error += (got[i] - expected[i]) * (got[i] - expected[i]);
        power += expected[i] * expected[i];
    }
    return static_cast<double>(std::sqrt(error / power));
}

Values<long double> Interleaved(const std::vector<Complex>& bins) {
    Values<long double> parts;
    for (const Complex& bin : bins) parts.insert(parts.end(), {bin.real(), bin.imag()});
    return parts;
}

// The lower half of the bins; what half the rate has is kept as the imaginary part of 0 Hz.
template <typename T>
Values<long double> PackedSpectrum(const Values<T>& samples) {
    const auto bins = Plain::Fft(std::vector<Complex>(samples.begin(), samples.end()));
    auto packed = Interleaved(bins);
    packed.resize(bins.size());
    if (packed.size() > 1) packed[1] = bins[packed.size() / 2].real();
    return packed;
}

template <typename T>
class CorvoFFTOf : public testing::Test {
protected:
    static constexpr double kTolerance = sizeof(T) == 4 ? 1e-6 : 1e-14;
};
using Precisions = testing::Types<float, double>;
TYPED_TEST_SUITE(CorvoFFTOf, Precisions);

TYPED_TEST(CorvoFFTOf, RealTransformsAreExactAndReturn) {
    for (const int length : kLengths) {
        const auto input = Noise<TypeParam>(static_cast<std::size_t>(length));
        CorvoFFT fft;
        auto data = input;
        fft.AllocateReal(length, 1);
        fft.DoFFTReal(data.data(), 0, 0);
        EXPECT_LT(Error(data, PackedSpectrum(input)), this->kTolerance) << length;

        const auto half = static_cast<std::size_t>(length / 2);
        Values<TypeParam> re(half), im(half), back(input.size());
        fft.DoFFTReal(input.data(), re.data(), im.data(), length, 0);
        for (std::size_t k = 0; k < half; ++k)
            ASSERT_TRUE(re[k] == data[2 * k] && im[k] == data[2 * k + 1]) << length << ", bin " << k;
        fft.DoIFFTReal(data.data(), 0, 0);
        EXPECT_LT(Error(data, {input.begin(), input.end()}), this->kTolerance) << length;
        fft.DoIFFTReal(back.data(), re.data(), im.data(), length, 0);
        EXPECT_TRUE(back == data || length == 1) << length;
    }
}

TYPED_TEST(CorvoFFTOf, ComplexTransformsAreExactAndReturn) {
    for (const int length : kLengths) {
        const auto input = Noise<TypeParam>(2 * static_cast<std::size_t>(length));
        std::vector<Complex> points;
        for (std::size_t i = 0; i < input.size(); i += 2) points.emplace_back(input[i], input[i + 1]);
        CorvoFFT fft;
        fft.Allocate(length, 1);
        auto data = input;
        fft.DoFFT(data.data(), 0, 0);
        EXPECT_LT(Error(data, Interleaved(Plain::Fft(points))), this->kTolerance) << length;
        fft.DoIFFT(data.data(), 0, 0);
        EXPECT_LT(Error(data, {input.begin(), input.end()}), this->kTolerance) << length;
    }
}

// 1000 is taken as 512; nothing behind these is touched.
TYPED_TEST(CorvoFFTOf, RoundsOddLengthsDown) {
    CorvoFFT fft;
    fft.AllocateReal(1000, 1);
    const auto input = Noise<TypeParam>(1000);
    auto data = input;
    fft.DoFFTReal(data.data(), 0, 0);
    const auto end = input.begin() + 512;
    EXPECT_LT(Error(data, PackedSpectrum(Values<TypeParam>(input.begin(), end))), this->kTolerance);
    EXPECT_TRUE(std::equal(end, input.end(), data.begin() + 512));
}

// After lengths that it cannot have. Built, it allocates nothing.
TYPED_TEST(CorvoFFTOf, DoesNothingUnlessBuilt) {
    const auto input = Noise<TypeParam>(64);
    auto data = input, re = input, im = input;
    CorvoFFT fft;
    const auto runAll = [&] {
        fft.DoIFFTReal(data.data(), 0, 0);
        fft.DoIFFTReal(data.data(), re.data(), im.data(), 64, 0);
        fft.DoIFFT(data.data(), 0, 0);
        fft.DoFFTReal(data.data(), 0, 0);
        fft.DoFFTReal(input.data(), re.data(), im.data(), 64, 0);
        fft.DoFFT(data.data(), 0, 0);
    };
    for (const int length : {0, 524289}) {
        fft.AllocateReal(length, 1);
        fft.Allocate(length, 1);
        runAll();
        EXPECT_TRUE(data == input && re == input && im == input) << length;
    }
    fft.AllocateReal(64, 1);
    fft.Allocate(32, 1);
    const TestSupport::AudioThreadRules rules;
    runAll();
    EXPECT_EQ(rules.Broken(), "");
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

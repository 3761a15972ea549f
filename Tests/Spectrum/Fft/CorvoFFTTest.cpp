#include "Spectrum/Fft/CorvoFFT.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <vector>

#include "Plain/PlainFft.h"
#include "Support/AudioThreadRules.h"
#include "Support/Signals.h"

namespace {

using Complex = std::complex<long double>;
using TestSupport::Noise;

template <typename T>
using Values = std::vector<T>;
constexpr int kLengths[] = {1, 2, 4, 8, 16, 32, 64, 128, 256, 512, 2048, 4096, 32768};

template <typename T>
class CorvoFFTOf : public testing::Test {
protected:
    using Exact = std::vector<Complex>;

    // Differs from these points by next to nothing, as a share of them.
    static void ExpectPoints(const Values<T>& got, const Exact& expected) {
        long double error = 0, power = 0;
        for (std::size_t i = 0; i < expected.size(); ++i) {
            error += std::norm(Complex(got[2 * i], got[2 * i + 1]) - expected[i]);
            power += std::norm(expected[i]);
        }
        EXPECT_LE(std::sqrt(error), std::sqrt(power) * (sizeof(T) == 4 ? 1e-6L : 1e-14L)) << expected.size();
    }
    static Exact Points(const Values<T>& values) {
        Exact points;
        for (std::size_t i = 0; i + 1 < values.size(); i += 2) points.emplace_back(values[i], values[i + 1]);
        return points;
    }
    // The lower half of the bins; what half the rate has is kept as the imaginary part of 0 Hz.
    static Exact PackedSpectrum(const Values<T>& samples) {
        auto bins = Plain::Fft(Exact(samples.begin(), samples.end()));
        bins[0].imag(bins[bins.size() / 2].real());
        bins.resize(bins.size() / 2);
        return bins;
    }
};
using Precisions = testing::Types<float, double>;
TYPED_TEST_SUITE(CorvoFFTOf, Precisions);

TYPED_TEST(CorvoFFTOf, TransformsAreExactAndReturn) {
    for (const int length : kLengths) {
        const auto size = static_cast<std::size_t>(length);
        CorvoFFT fft;
        fft.Allocate(length, 1);
        fft.AllocateReal(length, 1);
        const auto points = Noise<TypeParam>(2 * size);
        auto data = points;
        fft.DoFFT(data.data(), 0, 0);
        this->ExpectPoints(data, Plain::Fft(this->Points(points)));
        fft.DoIFFT(data.data(), 0, 0);
        this->ExpectPoints(data, this->Points(points));

        const auto samples = Noise<TypeParam>(size);
        data = samples;
        fft.DoFFTReal(data.data(), 0, 0);
        if (length > 1) this->ExpectPoints(data, this->PackedSpectrum(samples));
        Values<TypeParam> re(size / 2), im(size / 2), back(size);
        fft.DoFFTReal(samples.data(), re.data(), im.data(), length, 0);
        for (std::size_t k = 0; k < size / 2; ++k)
            ASSERT_TRUE(re[k] == data[2 * k] && im[k] == data[2 * k + 1]) << length << ", bin " << k;
        fft.DoIFFTReal(data.data(), 0, 0);
        this->ExpectPoints(data, this->Points(samples));
        EXPECT_TRUE(length > 1 || data == samples);
        fft.DoIFFTReal(back.data(), re.data(), im.data(), length, 0);
        EXPECT_TRUE(back == data || length == 1) << length;
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
    this->ExpectPoints(data, this->PackedSpectrum({input.begin(), end}));
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

// Catches tables that go while another object of the length still has them.
TEST(CorvoFFTSetUp, OutlivesOthersOfItsLength) {
    CorvoFFT kept;
    auto first = Noise<float>(64), second = first;
    {
        CorvoFFT other;
        for (auto* fft : {&other, &kept}) fft->AllocateReal(64, 0);
        other.DoFFTReal(first.data(), 0, 0);
    }
    CorvoFFT another;  // into the memory that may have become free
    another.AllocateReal(32, 0);
    kept.DoFFTReal(second.data(), 0, 0);
    EXPECT_EQ(first, second);
}

// Catches an inverse that goes, or changes its length, with a forward transform that is built anew; and one
// that stays when all is released.
TEST(CorvoFFTSetUp, ReplacesOnlyWhatItBuilds) {
    CorvoFFT fft;
    fft.Allocate(4, 1);
    fft.Allocate(2, 0);
    std::vector<double> points{1, 0, 2, 0, 3, 0, 4, 0};
    fft.DoFFT(points.data(), 0, 0);
    EXPECT_EQ(points, (std::vector<double>{3, 0, -1, 0, 3, 0, 4, 0}));
    points = {4, 0, 0, 0, 0, 0, 0, 0};
    fft.DoIFFT(points.data(), 0, 0);
    EXPECT_EQ(points, (std::vector<double>{1, 0, 1, 0, 1, 0, 1, 0}));
    fft.Free();
    fft.DoIFFT(points.data(), 0, 0);
    EXPECT_EQ(points, (std::vector<double>{1, 0, 1, 0, 1, 0, 1, 0}));
}

}  // namespace

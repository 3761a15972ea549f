#include <gtest/gtest.h>

#include <cstring>

#include "DSP/Equalizer/BiquadSection.h"
#include "DSP/Equalizer/EqCascade.h"
#include "Platform/DenormalGuard.h"
#include "Support/Signals.h"

// The kernels for every kind of register that this machine has, whichever of them the library would choose.
namespace {

using namespace Corvo::DSP;
using TestSupport::Random;

template <typename Sample>
std::vector<const EqKernels<Sample>*> AllKernels() {
    std::vector all{&EqBaselineKernels<Sample>()};
    if (__builtin_cpu_supports("avx2")) all.push_back(&EqAvx2Kernels<Sample>());
    return all;
}

// Band after band, sample after sample.
template <typename Sample>
void RunPlain(EqBand& band, Sample* samples, int frames, int stride) {
    for (int i = 0; i < frames; ++i, samples += stride) {
        band.ForEachCoefficient([](auto& c) { c.Advance(); });
        const auto& [b0, b1, b2, a1, a2] = band._eq_coeffs;
        const double w = *samples - a1.value * band.w1 - a2.value * band.w2;
        *samples = static_cast<Sample>(b0.value * w + b1.value * band.w1 + b2.value * band.w2);
        band.w2 = std::exchange(band.w1, w);
    }
}

EqBands RandomBands(Random& random, std::int32_t* counter, bool gliding) {
    EqBands bands;
    for (auto& band : bands) {
        band.ForEachCoefficient([counter](auto& c) { c.counter = counter; });
        // A small edit: on a long way some states between would be unstable.
        const auto type = static_cast<EQFilterType>(random.Below(7));
        const double freq = 30 + random.Below(18000), Q = 20 + random.Below(100);
        DesignBiquad(type, 2.0, freq, Q, 48000).HandTo(band._eq_coeffs, true);
        if (gliding && random.Below(4))
            DesignBiquad(type, 1.8, freq * 1.05, Q, 48000).HandTo(band._eq_coeffs, false);
        // Some are close to their end, others have nowhere to go.
        band.ForEachCoefficient([&](ManagedCoefficient& c) {
            if (c.moving && random.Below(3) == 0) c.value = c.target + (c.start - c.target) * 0.012;
        });
        auto& b1 = band._eq_coeffs.b1;
        if (b1.moving && random.Below(4) == 0) b1.value = b1.start = 5e-15, b1.target = -3e-15;
        band.w1 = random.Unit() - 0.5, band.w2 = random.Unit() - 0.5;
    }
    return bands;
}

template <typename Sample>
void CompareKernels(int channels, bool gliding) {
    const Corvo::DenormalGuard guard;
    Random random(static_cast<std::uint64_t>(channels));
    for (int count = 1; count <= 20; ++count)
        for (const int frames : {1, 2, 7, 30, 200}) {
            const int stride = channels + random.Below(2);
            std::int32_t counter = 0;
            const EqBands before[] = {RandomBands(random, &counter, gliding),
                                      RandomBands(random, &counter, gliding)};
            const int movingBefore = counter;
            const auto input = TestSupport::Noise<Sample>(static_cast<std::size_t>(frames * stride));
            auto expected = input;
            EqBands plain[] = {before[0], before[1]};
            const int first = random.Below(21 - count);
            for (int c = 0; c < channels; ++c)
                for (int b = first; b < first + count; ++b)
                    RunPlain(plain[c][static_cast<std::size_t>(b)], expected.data() + c, frames, stride);
            const int arrivals = movingBefore - counter;

            for (const auto* kernels : AllKernels<Sample>()) {
                auto samples = input;
                EqBands states[] = {before[0], before[1]};
                EqCascade<Sample> cascade{samples.data(), stride, frames, channels, 20};
                for (std::size_t c = 0; c < 2; ++c)
                    for (std::size_t b = 0; b < 20; ++b) cascade.bands[c][b] = &states[c][b];
                if (gliding)
                    EXPECT_EQ(kernels->gliding(cascade, first, count), arrivals);
                else
                    kernels->settled(cascade, first, count);
                ASSERT_EQ(std::memcmp(samples.data(), expected.data(), samples.size() * sizeof(Sample)), 0)
                    << channels << " channels, " << count << " bands, " << frames << " frames";
                for (std::size_t c = 0; c < 2; ++c)
                    for (std::size_t b = 0; b < 20; ++b) {
                        auto &got = states[c][b], &wanted = plain[c][b];
                        ASSERT_EQ(got.w1, wanted.w1);
                        ASSERT_EQ(got.w2, wanted.w2);
                        ASSERT_EQ(got.Moving(), wanted.Moving());
                        ASSERT_EQ(got._eq_coeffs.a1.value, wanted._eq_coeffs.a1.value);
                        ASSERT_EQ(got._eq_coeffs.b2.value, wanted._eq_coeffs.b2.value);
                    }
            }
        }
}

TEST(EqKernels, AllEqualTheBandsOneAfterTheOther) {
    for (const int channels : {1, 2})
        for (const bool gliding : {false, true}) {
            CompareKernels<float>(channels, gliding);
            CompareKernels<double>(channels, gliding);
        }
}

}  // namespace

#include <gtest/gtest.h>

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstring>
#include <limits>
#include <utility>
#include <vector>

#include "DSP/Effects/Denoiser/SpectrumKernels.h"
#include "DSP/Effects/Gain/GainKernel.h"
#include "DSP/Effects/Tube/TubeKernel.h"
#include "DSP/Pitch/ClassicKernel.h"
#include "DSP/Resampler/PolePairKernel.h"
#include "Platform/AlignedMemory.h"
#include "Platform/FiniteSamples.h"
#include "Platform/Processor.h"
#include "Spectrum/Fft/FftPlan.h"
#include "Spectrum/Scales/DecibelKernel.h"
#include "Support/Signals.h"

// The same project must sound and look the same on every machine: every kernel for wide registers gives the
// bits of the one that any processor runs. Catches a lane, an operation, an end of block or a rest behind
// whole registers that one of them treats otherwise.
namespace {

using TestSupport::Channel;
using TestSupport::ForBothSamples;
using TestSupport::Noise;
using Floats = std::vector<float>;

class WideRegisters : public testing::Test {
protected:
    void SetUp() override {
        if (!Corvo::HasAvx2()) GTEST_SKIP() << "no AVX2 here";
    }
    // What is no number may be no number in other bits.
    template <typename Sample>
    static void ExpectSameBits(const std::vector<Sample>& one, const std::vector<Sample>& other,
                               const testing::Message& what = {}) {
        const auto same = [](Sample a, Sample b) {
            return std::isnan(a) ? std::isnan(b) : std::memcmp(&a, &b, sizeof a) == 0;
        };
        const auto apart = std::ranges::mismatch(one, other, same);
        ASSERT_TRUE(apart.in1 == one.end() && apart.in2 == other.end())
            << what << " at " << apart.in1 - one.begin();
    }
};

TEST_F(WideRegisters, OfTheGainInBothLayouts) {
    using namespace Corvo::DSP::GainEfx;
    ForBothSamples([]<typename Sample>(Sample) {
        const Coefficients<Sample> c{Sample(0.7), Sample(1.3), Sample(-0.4), Sample(2.5)};
        for (int frames = 0; frames < 40; ++frames) {
            auto baseline = Noise<Sample>(2 * static_cast<std::size_t>(frames)), wide = baseline;
            auto left = Channel(wide, 0), right = Channel(wide, 1);
            BaselineKernels<Sample>().interleaved(baseline.data(), frames, c);
            Avx2Kernels<Sample>().interleaved(wide.data(), frames, c);
            Avx2Kernels<Sample>().planar(left.data(), right.data(), frames, c);
            ExpectSameBits(baseline, wide);
            ExpectSameBits(left, Channel(wide, 0));
            ExpectSameBits(right, Channel(wide, 1));
        }
    });
}

// Noise reaches every branch and both clamps; beside it what a damaged stream may hold.
TEST_F(WideRegisters, OfTheTube) {
    using namespace Corvo::DSP;
    constexpr int kFunctions = TubeShaping::kNoFunction + 1;
    ForBothSamples([]<typename Sample>(Sample) {
        using Limits = std::numeric_limits<Sample>;
        auto input = Noise<Sample>(1000, 1.2);
        for (const auto value : {Sample(0), -Sample(0), Limits::infinity(), Limits::quiet_NaN()})
            input.insert(input.begin() + 3, 2, value);
        for (int both = 0; both < kFunctions * kFunctions; ++both)
            for (const std::size_t count : {1000u, 1u, 2u, 3u, 14u, 0u}) {
                const TubeShaping shaping{
                    {{{both % kFunctions, 1.0f, 0.8f, 9.5f}, {both / kFunctions, 1.7f, 0.4f, 2.9f}}}};
                auto baseline = input, wide = input;
                BaselineTubeKernel<Sample>()(baseline.data(), count, shaping);
                Avx2TubeKernel<Sample>()(wide.data(), count, shaping);
                ExpectSameBits(baseline, wide, testing::Message() << "functions " << both);
            }
    });
}

// Frame after frame; both directions of pitch, and silence of either sign.
TEST_F(WideRegisters, OfTheClassicShifter) {
    using namespace Corvo::DSP::ClassicPitch;
    constexpr std::size_t kBins = 133;
    const auto table = Noise<float>(4 * kBins, 20000.0);
    const auto window = Noise<double>(kBins);
    const auto run = [&](const Kernels& kernels, double over) {
        std::vector<std::int32_t> last(kBins), target(kBins);
        Floats strength(kBins), frequency(kBins), sum(kBins);
        std::vector<double> phase(kBins), advance(kBins), found(kBins), all;
        for (const float pitch : {0.5f, 1.7f, -0.001f, 1.0f}) {
            auto input = Noise<float>(kBins, pitch);
            input[3] = 0.0f;
            input[4] = -0.0f;
            kernels.place({pitch, target.data()}, kBins);
            kernels.analyse({input.data(), window.data(), table.data(), table.data() + kBins,
                             table.data() + 2 * kBins, last.data(), strength.data(), frequency.data()},
                            kBins);
            kernels.advance({frequency.data(), target.data(), pitch, 187.5, 0.7, over, advance.data()},
                            kBins);
            kernels.analyseStanding({input.data() + 1, window.data(), advance.data(), window.data(),
                                     phase.data(), last.data(), strength.data(), found.data()},
                                    kBins - 1);
            kernels.synthesise(
                {strength.data(), found.data(), window.data(), 128 * over, phase.data(), sum.data()}, kBins);
            for (const auto* each : {&strength, &frequency, &sum})
                all.insert(all.end(), each->begin(), each->end());
            for (const auto* each : {&last, &target}) all.insert(all.end(), each->begin(), each->end());
            for (const auto* each : {&phase, &advance, &found})
                all.insert(all.end(), each->begin(), each->end());
        }
        return all;
    };
    for (const double over : {3.0, 4.0})
        ExpectSameBits(run(BaselineKernels(), over), run(Avx2Kernels(), over));
}

// Up and down, with less room at a time than one sample may fill.
TEST_F(WideRegisters, OfTheConverter) {
    auto input = Noise<double>(2 * 300);
    std::fill_n(input.begin() + 100, 50, -0.0);
    const auto outputs = [&](PolePairs::Kernel run, int up, int down) {
        const PolePairLowPass filter(up, 0.455 / std::max(up, down));
        PolePairs::State state;
        std::vector<double> all;
        alignas(16) double in[600], out[2 * 7];
        std::ranges::copy(input, in);
        PolePairs::Stream stream{in, 300, nullptr, 0, up, down, up};
        do {
            stream.out = out;
            stream.room = 7;
            run(filter, state, stream);
            all.insert(all.end(), out, stream.out);
        } while (stream.room == 0);
        return all;
    };
    for (const auto& [up, down] : {std::pair{160, 147}, {2, 1}, {1, 8}, {16, 1}})
        ExpectSameBits(outputs(PolePairs::RunBaseline, up, down), outputs(PolePairs::RunAvx2, up, down));
}

// Every kind of float: zeros, denormals, infinities and what is no number among them.
TEST_F(WideRegisters, OfDecibels) {
    Floats powers;
    for (std::uint64_t bits = 0; bits < (1ull << 32); bits += 3000017)
        powers.push_back(std::bit_cast<float>(static_cast<std::uint32_t>(bits)));
    const auto levels = [&](auto convert, std::size_t count) {
        Floats result(count);
        convert(powers.data() + powers.size() - count, result.data(), count, 1.5f);
        return result;
    };
    for (std::size_t count = powers.size() - 17; count <= powers.size(); ++count)
        ExpectSameBits(levels(Corvo::PowerToDecibelsBaseline, count),
                       levels(Corvo::PowerToDecibelsAvx2, count));
}

TEST_F(WideRegisters, OfTheTransform) {
    using namespace Corvo::Fft;
    using Bytes = std::vector<unsigned char, Corvo::AlignedAllocator<unsigned char>>;
    const auto check = []<typename Sample>(Sample, Kind kind, int order) {
        Bytes memory(PlanBytes<Sample>(order, kind));
        const auto& plan = *BuildPlan<Sample>(memory.data(), order, kind);
        Bytes work(WorkValues(plan.points) * sizeof(Sample));
        auto* const scratch = reinterpret_cast<Sample*>(work.data());
        const auto input = Noise<Sample>(std::max<std::size_t>(2 * plan.points, 1));
        const auto run = [&](const Kernels<Sample>& kernels) {
            std::vector<Sample> out(input.size()), back(input.size());
            const bool real = kind == Kind::Real;
            (real ? kernels.realForward : kernels.complexForward)(plan, input.data(), out.data(), scratch);
            (real ? kernels.realInverse : kernels.complexInverse)(plan, out.data(), back.data(), scratch);
            out.insert(out.end(), back.begin(), back.end());
            return out;
        };
        ExpectSameBits(run(BestKernels<Sample>()), run(BaselineKernels<Sample>()));
    };
    for (const Kind kind : {Kind::Real, Kind::Complex})
        for (int order = 0; order <= 13; ++order)
            ForBothSamples([&](auto sample) { check(sample, kind, order); });
}

// Everything that they make of the same input, one behind the other.
Floats Everything(const Corvo::DSP::Denoising::SpectrumKernels& kernels) {
    constexpr std::size_t kCount = 160, kHalf = 144;
    std::vector<Floats> in;
    for (std::uint64_t seed = 1; seed <= 6; ++seed) {
        in.push_back(Noise<float>(kCount, 1.0, seed));
        for (auto& value : in.back()) value = std::exp(8.0f * value);
    }
    const float* const frames[]{in[0].data(), in[1].data(), in[2].data()};
    const float weights[]{0.5f, 0.3f, 0.2f, 0.1f};
    Floats all, a(kCount), b(kCount), c(kCount);
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
    const auto quiet = kernels.quiet(in[0].data(), frames[1], 99, 40);
    all.insert(all.end(), {quiet.count, quiet.sum, quiet.logSum});
    return all;
}

TEST_F(WideRegisters, OfTheDenoiser) {
    using namespace Corvo::DSP::Denoising;
    ExpectSameBits(Everything(BaselineSpectrumKernels()), Everything(Avx2SpectrumKernels()));
}

// Catches a lane, a loop or an end that is not looked at, and one that looks past the block: NaN stands
// around it.
template <typename Sample>
void ExpectEveryPlaceSeen(bool (*version)(const Sample*, std::size_t)) {
    using Limits = std::numeric_limits<Sample>;
    const Sample finite[] = {1, -Sample(0), Limits::denorm_min(), Limits::max(), -Limits::max()};
    for (std::size_t count = 0; count <= 70; ++count) {
        std::vector<Sample> samples(count + 2, Limits::quiet_NaN());
        Sample* const block = samples.data() + 1;
        for (std::size_t i = 0; i < count; ++i) block[i] = finite[i % (count % 2 ? 5 : 3)];
        ASSERT_TRUE(version(block, count)) << count;
        for (std::size_t at = 0; at < count; ++at)
            for (const Sample bad : {Limits::infinity(), -Limits::infinity(), Limits::quiet_NaN()}) {
                const Sample good = std::exchange(block[at], bad);
                ASSERT_FALSE(version(block, count)) << bad << " at " << at << " of " << count;
                block[at] = good;
            }
    }
}

TEST(FiniteSamples, OneThatIsNotIsSeenAtEveryPlace) {
    ExpectEveryPlaceSeen<float>(Corvo::AllFiniteBaseline);
    ExpectEveryPlaceSeen<double>(Corvo::AllFiniteBaseline);
    if (!Corvo::HasAvx2()) return;
    ExpectEveryPlaceSeen<float>(Corvo::AllFiniteAvx2);
    ExpectEveryPlaceSeen<double>(Corvo::AllFiniteAvx2);
}

}  // namespace

#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <limits>

#include "DSP/Effects/Compressor/Compressor.h"
#include "DSP/Effects/Echo/Echo.h"
#include "DSP/Equalizer/ParEQ.h"
#include "DSP/Pitch/PitchAdapter.h"
#include "DSP/Resampler/SamplingFrequencyConverter.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/kivspectrum.h"
#include "Support/EveryEffect.h"

using namespace TestSupport;

// A sample that is not finite counts as 0, so that nothing keeps it.
namespace {

constexpr int kFrames = 256, kRate = 8000;
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN(),
                 kInfinity = std::numeric_limits<double>::infinity();

// Takes the next interleaved stereo block and gives what comes out.
using Subject = std::function<std::vector<double>(std::vector<double>)>;

template <typename Sample>
std::vector<Sample> As(const std::vector<double>& block) {
    std::vector<Sample> samples;
    for (const double value : block) samples.push_back(static_cast<Sample>(value));
    return samples;
}
// Calls `process` with the block as samples of that type, and gives what it made of them.
template <typename Sample>
std::vector<double> InPlace(const std::vector<double>& block, const auto& process) {
    auto samples = As<Sample>(block);
    process(samples.data());
    return {samples.begin(), samples.end()};
}

template <typename Sample>
Subject OfEffect(std::shared_ptr<CorvoEffectBase> effect, bool planar) {
    const auto format = Format<Sample>(2, kRate);
    effect->InitProcessing(kFrames, &format);
    return [=](const std::vector<double>& block) {
        return InPlace<Sample>(block, [&](Sample* samples) {
            if (!planar) return ProcessBlock(*effect, samples, kFrames, format);
            std::array<std::vector<Sample>, 2> planes;
            for (int i = 0; i < 2 * kFrames; ++i)
                planes[static_cast<std::size_t>(i % 2)].push_back(samples[i]);
            double* const channels[] = {reinterpret_cast<double*>(planes[0].data()),
                                        reinterpret_cast<double*>(planes[1].data())};
            Corvo::DSP::ProcessFlags flags;
            effect->ProcessNoninterleaved(channels, kFrames, &format, flags);
            for (std::size_t i = 0; i < 2 * kFrames; ++i) samples[i] = planes[i % 2][i / 2];
        });
    };
}

// A steady sound under a side-chain.
template <typename Sample>
Subject SideChain(bool monitored) {
    auto effect = std::make_shared<Corvo::DSP::Compressor>();
    effect->SetPreset(2);
    effect->SetParam(14, monitored ? 1.0f : 0.0f, false);
    effect->SetSidechainBusNumChannels(0, 2);
    const auto run = OfEffect<Sample>(effect, false);
    return [=](const std::vector<double>& block) {
        auto side = As<Sample>(block);
        double* const channels[] = {reinterpret_cast<double*>(side.data()),
                                    reinterpret_cast<double*>(side.data() + kFrames)};
        effect->SetSidechainBuffer(0, channels);
        return run(std::vector<double>(block.size(), 0.5));
    };
}

template <typename Sample>
Subject Equaliser(bool apart) {
    using namespace Corvo::DSP;
    const auto eq = std::make_shared<ParEQ>();
    const auto records = std::make_shared<std::array<builtin_effects_data, 2>>();
    for (int band = 0; band < 3; ++band) records->front().SetEqBoost(band, 60);
    eq->Cook(false, false, records->data(), kRate, 2);
    return [=](const std::vector<double>& block) {
        return InPlace<Sample>(block, [&](Sample* samples) {
            if (!apart) return eq->Process(samples, kFrames, 2, false, records->data());
            for (const int channel : {0, 1})
                eq->ProcessSingle(samples, kFrames, 2, false, channel, records->data());
        });
    };
}

template <typename Sample>
Subject BackEnd(int index, bool padded) {
    const std::shared_ptr<Corvo::DSP::PitchAdapter> adapter(Corvo::DSP::PitchAdapter::CreateAdapter(index));
    adapter->SetChannelsNum(2);
    adapter->SetSampleRate(kRate);
    for (const int channel : {0, 1}) adapter->SetPitchFactor(channel, 1.2f);
    adapter->SetFFTSize(1);
    adapter->SetQuality(4);
    adapter->CookFactors();
    return [=](const std::vector<double>& block) {
        return InPlace<Sample>(block, [&](Sample* samples) {
            padded ? adapter->ProcessInPlace(samples, kFrames)
                   : static_cast<void>(adapter->ProcessInPlaceNoPadding(samples, kFrames));
        });
    };
}

// A frame may be longer than its samples.
template <typename In>
Subject Converter(int frameSamples) {
    struct Owned : SamplingFrequencyConverter {
        ~Owned() { FreeRings(); }
    };
    const auto converter = std::make_shared<Owned>();
    converter->InitConversionByFactors(3, 2);
    converter->Init(2);
    return [=](const std::vector<double>& block) {
        auto in = As<typename In::Value>(block);
        const int frames = 2 * kFrames / frameSamples;
        std::vector<double> out(2 * (kFrames * 3 / 2 + 1));
        converter->template sfreq_conversion_core_block<In, tipo_doublebit_outd>(
            frames, reinterpret_cast<char*>(in.data()), reinterpret_cast<char*>(out.data()), 2,
            frameSamples * In::kBytes, 16, nullptr);
        return out;
    };
}

template <typename Sample>
Subject Analyser() {
    const auto analyser = std::make_shared<kivspectrum>();
    return [=](const std::vector<double>& block) {
        analyser->Feed(As<Sample>(block).data(), kFrames, 2, 2);
        analyser->PrepareFFTForDrawing(kRate, true, false, false, false);
        const auto& smoothed = analyser->GetSpectrumDrawer()->GetPowerSmoothed();
        return std::vector<double>(smoothed.begin(), smoothed.end());
    };
}

// One that was given samples that are not finite sounds like one that was given 0 in their places, from the
// next block on.
void ExpectToCountAsZero(const std::function<Subject()>& make, const std::string& name) {
    constexpr int kBlocks = 40, kBad = 12;
    for (const double poison : {kNaN, kInfinity, -kInfinity})
        for (const std::size_t count : {1, 2 * kFrames}) {
            SCOPED_TRACE(name + ", " + std::to_string(count) + " times " + std::to_string(poison));
            const Subject poisoned = make(), clean = make();
            for (int i = 0; i < kBlocks; ++i) {
                auto block = Noise<double>(2 * kFrames, 0.25, static_cast<std::uint64_t>(i) + 1), bad = block;
                if (i == kBad) {
                    std::fill_n(block.begin() + (count == 1 ? 101 : 0), count, 0.0);
                    std::fill_n(bad.begin() + (count == 1 ? 101 : 0), count, poison);
                }
                const auto expected = clean(block), output = poisoned(bad);
                for (std::size_t k = 0; i != kBad && k < output.size(); ++k) {
                    ASSERT_TRUE(std::isfinite(output[k])) << "block " << i << ", sample " << k;
                    ASSERT_EQ(output[k], expected[k]) << "block " << i << ", sample " << k;
                }
            }
        }
}

}  // namespace

using EveryMemory = EveryEffect;
INSTANTIATE_TEST_SUITE_P(All, EveryMemory, testing::ValuesIn(AllEffects()), EffectTestName);

TEST_P(EveryMemory, TakesWhatIsNotFiniteForZero) {
    for (const std::uint64_t seed : {0, 1, 2}) {
        const auto made = [seed] {
            std::shared_ptr<CorvoEffectBase> effect = Make();
            Random random(seed);
            if (seed > 0 && !GetParam().mayGrow) SetAllParams(*effect, random);
            return effect;
        };
        const auto settings = ", settings " + std::to_string(seed);
        ExpectToCountAsZero([&] { return OfEffect<float>(made(), false); }, "floats" + settings);
        ExpectToCountAsZero([&] { return OfEffect<double>(made(), false); }, "doubles" + settings);
        if (!made()->SupportsNoninterleaved()) continue;
        ExpectToCountAsZero([&] { return OfEffect<float>(made(), true); }, "planar floats" + settings);
        ExpectToCountAsZero([&] { return OfEffect<double>(made(), true); }, "planar doubles" + settings);
    }
}

// Samples near the largest number, and every gain at its top: what is infinite then is gone after a second.
TEST_P(EveryMemory, ForgetsWhatGrewBeyondAllNumbers) {
    std::shared_ptr<CorvoEffectBase> effect = Make();
    const auto run = OfEffect<float>(effect, false);
    for (const float setting : {1.0f, 0.9f}) {
        if (GetParam().mayGrow)
            for (int i = 4; i < effect->GetParamCount(); ++i) effect->SetParam(i, setting, false);
        for (int i = 0; i < 40; ++i) run(Noise<double>(2 * kFrames, 3.4e38));
        effect->SetPreset(effect->GetDefaultPreset());
        std::vector<double> output;
        for (int i = 0; i < 120; ++i) output = run(Noise<double>(2 * kFrames));
        ASSERT_TRUE(std::ranges::all_of(output, [](double sample) { return std::isfinite(sample); }));
    }
}

TEST(NonFiniteSamples, CountAsZeroBesideTheEffects) {
    for (const bool other : {false, true}) {
        const std::string which = other ? " (other)" : "";
        ExpectToCountAsZero([=] { return SideChain<float>(other); }, "side-chain, floats" + which);
        ExpectToCountAsZero([=] { return SideChain<double>(other); }, "side-chain, doubles" + which);
        ExpectToCountAsZero([=] { return Equaliser<float>(other); }, "equaliser, floats" + which);
        ExpectToCountAsZero([=] { return Equaliser<double>(other); }, "equaliser, doubles" + which);
        ExpectToCountAsZero([=] { return BackEnd<float>(1, other); }, "New, floats" + which);
        ExpectToCountAsZero([=] { return BackEnd<double>(1, other); }, "New, doubles" + which);
    }
    ExpectToCountAsZero([] { return BackEnd<float>(0, true); }, "Classic");
    for (const int frameSamples : {2, 4}) {
        ExpectToCountAsZero([=] { return Converter<tipo_floatbit>(frameSamples); }, "converter, floats");
        ExpectToCountAsZero([=] { return Converter<tipo_doublebit>(frameSamples); }, "converter, doubles");
    }
    ExpectToCountAsZero([] { return Analyser<float>(); }, "analyser, floats");
    ExpectToCountAsZero([] { return Analyser<double>(); }, "analyser, doubles");
}

// A loop gain above 1 goes over all numbers again and again; each time the block after is finite.
TEST(NonFiniteSamples, AnEchoThatGrowsStartsAfresh) {
    const auto effect = std::make_shared<Corvo::DSP::Echo>();
    for (int i = 4; i < effect->GetParamCount(); ++i) effect->SetParam(i, 1.0f, false);
    effect->SetParam(0, 0.0f, false);
    effect->SetParam(1, 0.0f, false);
    const auto run = OfEffect<float>(effect, false);
    bool finite = true;
    int grown = 0;
    for (int i = 0; i < 2000; ++i) {
        const auto output = run(Noise<double>(2 * kFrames));
        const bool now = std::ranges::all_of(output, [](double sample) { return std::isfinite(sample); });
        ASSERT_TRUE(now || finite) << "block " << i << " and the one before";
        grown += finite && !now;
        finite = now;
    }
    EXPECT_GT(grown, 1) << "nothing was asked of it";
}

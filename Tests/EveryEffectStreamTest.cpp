#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <limits>

#include "Support/EveryEffect.h"

using namespace TestSupport;

// What every effect promises about streams of audio.
namespace {

// Every parameter moved once in the last third, when delay lines are full, so that glides are cut as well.
std::vector<Edit> MoveEverything(CorvoEffectBase& effect, std::size_t frames, std::uint64_t seed) {
    Random random(seed);
    const int count = effect.GetParamCount();
    std::vector<Edit> edits;
    for (int i = 0; i < count; ++i)
        edits.push_back(
            {2 * frames / 3 + static_cast<std::size_t>(i) * frames / static_cast<std::size_t>(4 * count), i,
             static_cast<float>(random.Unit())});
    return edits;
}

template <typename Sample>
bool Close(Sample a, Sample b, Cuts cuts) {
    const double rounding =
        std::is_same_v<Sample, float> ? 1.2e-7 * std::max(std::abs(static_cast<double>(a)), 1e-3) : 0.0;
    const double difference = std::abs(static_cast<double>(a) - static_cast<double>(b));
    return a == b || (cuts == Cuts::PhasePerBlock && difference <= 1e-12 + rounding);
}

template <typename Sample>
void ExpectTheSameHoweverCut(const EffectCase& row, int rate) {
    constexpr std::size_t kFrames = 5000;
    const auto format = Format<Sample>(2, rate);
    const auto input = Noise<Sample>(2 * kFrames);
    std::vector<int> random(40);
    Random source(7);
    for (auto& cut : random) cut = 1 + source.Below(700);
    std::vector<Sample> whole;
    for (const auto& cuts : {std::vector<int>{kFrames}, {1}, {7}, {64}, {511}, {4096}, random}) {
        const auto effect = row.Make();
        const auto output = Render(*effect, input, format, cuts, MoveEverything(*effect, kFrames, 3));
        if (whole.empty()) whole = output;
        for (std::size_t i = 0; i < output.size(); ++i)
            ASSERT_TRUE(Close(output[i], whole[i], row.cuts))
                << "frame " << i / 2 << ", blocks of " << cuts.front() << ": " << output[i] << " instead of "
                << whole[i];
    }
}

using EditSettings = std::function<void(CorvoEffectBase&)>;

// The second of two blocks; the edit is made in front of the first or between them.
std::vector<float> SecondBlock(CorvoEffectBase& effect, const EditSettings& edit, bool whileItRuns) {
    constexpr int kFrames = 4000;
    const auto format = Format<float>(2, 8000);
    SetAllParams(effect, Random(5));
    if (!whileItRuns) edit(effect);
    effect.InitProcessing(kFrames, &format);
    std::vector<float> block;
    for (const bool second : {false, true}) {
        block = Noise<float>(2 * kFrames);
        if (second && whileItRuns) edit(effect);
        ProcessBlock(effect, block.data(), kFrames, format);
    }
    return block;
}

}  // namespace

INSTANTIATE_TEST_SUITE_P(All, EveryEffect, testing::ValuesIn(AllEffects()), EffectTestName);

// Catches state lost, advanced twice or rounded at a block's edge. At 8 kHz the stream is several passes of
// every delay line.
TEST_P(EveryEffect, GivesTheSameOutputHoweverTheStreamIsCut) {
    if (GetParam().cuts == Cuts::Exempt) GTEST_SKIP() << "its engine works in pieces of its own";
    ExpectTheSameHoweverCut<float>(GetParam(), 8000);
    ExpectTheSameHoweverCut<double>(GetParam(), 8000);
}

// Catches a per-channel path that lags behind the interleaved one, or that touches what it does not support.
TEST_P(EveryEffect, TreatsPlanarBlocksLikeInterleavedOnes) {
    constexpr std::size_t kFrames = 2000;
    for (const std::size_t count : {1u, 2u}) {
        const auto format = Format<double>(static_cast<int>(count));
        const auto input = Noise<double>(count * kFrames);
        const auto planar = Make(), interleaved = Make();
        for (auto* effect : {planar.get(), interleaved.get()}) SetAllParams(*effect, Random(6));
        planar->InitProcessing(kFrames, &format);
        Corvo::DSP::ProcessFlags flags;
        planar->ProcessNoninterleaved(nullptr, 0, &format, flags);
        auto output = input;
        ProcessPlanes(*planar, output, format);
        const auto expected =
            planar->SupportsNoninterleaved() ? Render(*interleaved, input, format, {kFrames}) : input;
        ASSERT_EQ(output, expected) << count << " channels";
    }
}

// Catches a preparation that goes another way, or leaves something behind, where there was one before.
TEST_P(EveryEffect, SoundsTheSamePreparedTwice) {
    const auto once = Make(), twice = Make();
    const auto format = Format<float>();
    const auto input = Noise<float>(2 * 20000);
    twice->InitProcessing(512, &format);
    EXPECT_EQ(Render(*twice, input, format, {512}), Render(*once, input, format, {512}));
}

// Catches delay lines and filters that only fit the usual rates, a format change in mid-stream that the
// effect was not prepared for, and prepared memory that a block larger than announced, or a second
// preparation, runs out of.
TEST_P(EveryEffect, StaysInsideItsBlocksAtAnyRateAndSize) {
    const auto effect = Make();
    if (!GetParam().mayGrow) SetAllParams(*effect, Random(6));
    const auto run = [&]<typename Sample>(Sample, int rate, int channels) {
        const auto format = Format<Sample>(channels, rate);
        for (const bool prepared : {false, true}) {
            if (prepared) effect->InitProcessing(100, &format);
            for (const int frames : {100, 200, 1, 0}) {
                const int edge = 2 * channels;  // samples on each side that are not the effect's
                const auto before = Noise<Sample>(static_cast<std::size_t>(frames * channels + 2 * edge));
                auto block = before;
                ProcessBlock(*effect, block.data() + edge, frames, format);
                ASSERT_TRUE(AllFinite(block) &&
                            std::equal(before.begin(), before.begin() + edge, block.begin()) &&
                            std::equal(before.end() - edge, before.end(), block.end() - edge))
                    << rate << " Hz, " << channels << " channels, " << frames;
            }
        }
    };
    for (const int rate : {48000, 1000, 7919, 8000, 44056, 44100, 96001, 192000, 768000, 48000})
        for (const int channels : {2, 1}) ForBothSamples([&](auto sample) { run(sample, rate, channels); });
}

// Catches settings that blow up inside their allowed range.
TEST_P(EveryEffect, StaysFiniteAtEverySetting) {
    const auto format = Format<float>();
    const auto input = Noise<float>(2 * 3000);
    const auto check = [&](const auto& set, const std::string& what) {
        const auto effect = Make();
        set(*effect);
        const auto output = Render(*effect, input, format, {512});
        if (!GetParam().mayGrow) {
            ASSERT_TRUE(AllFinite(output)) << what;
        }
        effect->Cleanup();
        effect->SetPreset(effect->GetDefaultPreset());
        for (int i = 0; effect->NumPresets() == 0 && i < effect->GetParamCount(); ++i)
            effect->SetParam(i, 0.5f, false);
        ASSERT_TRUE(AllFinite(Render(*effect, input, format, {512}))) << what << ", afterwards";
    };
    const auto plain = Make();
    for (int i = 0; i < plain->GetParamCount(); ++i)
        for (const float value : {0.0f, 1.0f, std::numeric_limits<float>::quiet_NaN(), -1e30f, 1e30f}) {
            // The gain effect stores what it is given, however far out of range.
            if (std::abs(value) > 1.0f && std::string(GetParam().name) == "Gain") continue;
            check([&](auto& effect) { effect.SetParam(i, value, false); },
                  "parameter " + std::to_string(i) + " at " + std::to_string(value));
        }
    for (std::uint64_t seed = 1; seed <= 50; ++seed)
        check([&](auto& effect) { SetAllParams(effect, Random(seed)); },
              "random settings " + std::to_string(seed));
}

// Catches noise, constant offsets and oscillation where there should be nothing.
TEST_P(EveryEffect, KeepsSilenceSilent) {
    const auto effect = Make();
    const auto format = Format<double>();
    for (const double sample : Render(*effect, std::vector<double>(2 * 20000), format, {512}))
        ASSERT_LT(std::abs(sample), 1e-9);
}

// Catches settings that are stored and never taken into use: what makes a difference beforehand makes one
// while the stream runs.
TEST_P(EveryEffect, HearsEditsWhileTheStreamRuns) {
    const auto expectHeard = [&](const EditSettings& edit, const std::string& what) {
        const auto plain = SecondBlock(
            *Make(), [](auto&) {}, true);
        if (SecondBlock(*Make(), edit, false) != plain) {
            EXPECT_NE(SecondBlock(*Make(), edit, true), plain) << what;
        }
    };
    const auto other = Make();
    for (int index = 0; index < other->GetParamCount(); ++index)
        expectHeard(
            [=](auto& effect) { effect.SetParam(index, effect.GetParam(index) < 0.5f ? 0.9f : 0.1f, false); },
            "parameter " + std::to_string(index));
    for (int preset = 0; preset < other->NumPresets(); preset += 5)
        expectHeard([=](auto& effect) { effect.SetPreset(preset); }, "preset " + std::to_string(preset));
    SetAllParams(*other, Random(8));
    expectHeard([chunk = Chunk(*other)](auto& effect) { effect.SetSettingsChunk(chunk); }, "a chunk");
}

// Catches delay lines that play on what was there before the host jumped.
TEST_P(EveryEffect, RingsNoMoreAfterALightReset) {
    const auto effect = Make();
    const auto format = Format<float>(2, 8000);
    auto block = Render(*effect, Noise<float>(2 * 4000), format, {4000});
    if (!(effect->LongestGap() > 0.0)) GTEST_SKIP() << "has no delay line";
    effect->InitResetProcessingLight(true);
    std::ranges::fill(block, 0.0f);
    ProcessBlock(*effect, block.data(), 4000, format);
    EXPECT_EQ(block, std::vector<float>(block.size()));
}

#include <gtest/gtest.h>

#include <algorithm>

#include "DSP/Effects/Compressor/CompressorPresets.h"
#include "Support/CompressorProbe.h"

using namespace TestSupport;
using Corvo::DSP::CompressorPrivate::kCompressorPresets;
using Corvo::DSP::CompressorPrivate::TransferCurve;

// What threshold and ratio do to the shapes that are there, and what they read back.
namespace {

int StepOf(float position) { return static_cast<int>(position * 251.0f); }

double DesignedGain(double level, double threshold, double slope, double knee) {
    const double into = std::clamp(level - threshold + knee / 2.0, 0.0, knee);
    return (slope - 1.0) * (into * into / (2.0 * knee) + std::max(level - threshold - knee / 2.0, 0.0));
}

}  // namespace

// Catches a knee that turns hard, loses its width at a ratio of 1 or at the top, drifts, or is drawn too
// coarsely.
TEST(CompressorEdit, KneesMoveAlong) {
    const auto levels = Levels(-90.0, 0.0, 1.7);
    // Ratios are words of 0 and more, thresholds of less.
    const int edits[] = {-341, 0, 251, -10, -800, 100, -60, 200, 1, -300, 125};
    for (const int preset : {1, 2, 3, 17, 20, 40}) {
        const auto& row = kCompressorPresets[static_cast<std::size_t>(preset)];
        double threshold = row.threshold, slope = 1.0 / row.ratio;
        Compressor effect;
        effect.SetPreset(preset);
        SetBoth(effect, kOutGain, OutGainPosition(0));
        SetBoth(effect, kMakeUp, 0.0f);
        SetBoth(effect, kAttack, TimePosition(100));
        for (const int word : edits) {
            if (word < 0) {
                threshold = word / 10.0;
                for (int i = 0; i < 50; ++i) SetBoth(effect, kThreshold, static_cast<float>(i) / 50.0f);
                SetBoth(effect, kThreshold, ThresholdPosition(word));
            } else {
                slope = 1.0 - word / 251.0;
                SetBoth(effect, kRatio, RatioPosition(word));
            }
            const auto gains = SteadyGains(effect, levels, 200);
            for (std::size_t i = 0; i < levels.size(); ++i)
                ASSERT_NEAR(gains[i], DesignedGain(levels[i], threshold, slope, std::max(row.knee, 1e-9)),
                            0.05)
                    << row.name << " at " << threshold << " dB, slope " << slope << ", level " << levels[i];
        }
    }
}

// Catches controls that read back another position than they were set to, or than the curve's text; and one
// that redraws the curve when it is written back.
TEST(CompressorEdit, WritingBackChangesNothing) {
    for (int preset = 0; preset < 42; ++preset)
        for (const bool fromAutomation : {false, true}) {
            Compressor effect;
            effect.SetPreset(preset);
            // Without the remembered words at the chunk's end.
            const auto state = [&] {
                auto chunk = Chunk(effect);
                chunk.resize(16100);
                return std::pair(chunk, Text(effect, kThreshold) + Text(effect, kRatio));
            };
            const auto before = state();
            for (int index = kThreshold; index < kStereoLink; ++index)
                effect.SetParam(index, effect.GetParam(index), fromAutomation);
            EXPECT_EQ(state(), before) << preset;
        }
    Compressor effect;
    effect.SetPreset(1);
    for (int step = 251; step >= 0; --step) {
        effect.SetParam(kRatio, RatioPosition(step), false);
        ASSERT_EQ(StepOf(effect.GetParam(kRatio)), step);
    }
}

// Catches presets that read back a ratio below the one they show.
TEST(CompressorEdit, RatiosReadTheLowestStepOfTheirText) {
    Compressor effect;
    effect.SetPreset(2);
    std::vector<double> ratios;
    for (int step = 0; step < 249; ++step) {  // from there on infinite
        effect.SetParam(kRatio, RatioPosition(step), false);
        ratios.push_back(std::stod(Text(effect, kRatio)));
    }
    for (int preset = 0; preset < 42; ++preset) {
        effect.SetPreset(preset);
        const auto text = Text(effect, kRatio);
        const bool flat = text == "Inf.:1 " || text == "-2.5:1 ";
        // No step shows 12.0.
        const auto lowest = flat ? 251 : std::ranges::lower_bound(ratios, std::stod(text)) - ratios.begin();
        EXPECT_EQ(StepOf(effect.GetParam(kRatio)), lowest) << text;
    }
}

TEST(CompressorEdit, EachSideReadsItsOwnCurve) {
    Compressor effect;
    for (const bool fromAutomation : {false, true}) {
        effect.SetPreset(2);
        const float threshold = effect.GetParam(kThreshold + 1), ratio = effect.GetParam(kRatio + 1);
        effect.SetParam(kThreshold, ThresholdPosition(-400), fromAutomation);
        effect.SetParam(kRatio, RatioPosition(40), fromAutomation);
        EXPECT_EQ(Text(effect, kThreshold), "-40.0 dB");
        EXPECT_EQ(StepOf(effect.GetParam(kRatio)), 40);
        EXPECT_EQ(effect.GetParam(kThreshold + 1), threshold);
        EXPECT_EQ(effect.GetParam(kRatio + 1), ratio);
        EXPECT_NE(effect.GetParam(kThreshold), threshold);
    }
}

// Catches a first edit, or a glide's end, that is heard as a step. At a rate where a glide is 4100 frames.
TEST(CompressorEdit, FirstEditsDoNotStep) {
    const auto format = Format<double>(2, 8000);
    Random random(5);
    for (int round = 0; round < 60; ++round) {
        const double level = Amplitude(-75.0 * random.Unit());
        const int preset = random.Below(42), other = random.Below(42);
        Compressor effect;
        effect.SetPreset(preset);
        SetBoth(effect, kStereoLink, round % 2 == 0 ? 1.0f : 0.0f);
        SetBoth(effect, kAttack, 0.0f);
        effect.InitProcessing(6000, &format);
        std::vector<double> before(2 * 6000, level), block = before;
        ProcessBlock(effect, before.data(), 6000, format);
        if (round % 3 == 0)
            effect.SetPreset(other);
        else
            SetBoth(effect, round % 3 == 1 ? kThreshold : kRatio, static_cast<float>(random.Unit()));
        ProcessBlock(effect, block.data(), 6000, format);
        const double louder = std::max(before.back(), block.back());
        double last = before.back();
        for (std::size_t i = 1; i < block.size(); i += 2) {
            ASSERT_LT(Decibels(1.0 + std::abs(block[i] - last) / louder), 0.1)
                << preset << ", round " << round << ", level " << level << ", frame " << i / 2;
            last = block[i];
        }
    }
}

// Catches a bend drawn by hand that an edit flattens. Its threshold is where its straight line begins.
TEST(CompressorEdit, ADrawnBendMovesAlong) {
    TransferCurve curve;
    curve.Add(0.0, 0.0);
    for (const auto& [in, out] : {std::pair{-60, -60}, {-40, -40}, {-30, -33}, {-20, -28}, {0, -23}})
        curve.Add(Amplitude(in), Amplitude(out));
    curve.UpdateSlopes();
    curve.MoveThreshold(-300);
    const std::pair<double, double> moved[] = {{-50, -50}, {-40, -43}, {-30, -38}, {0, -30.5}};
    for (const auto& [in, out] : moved) {
        const auto* const point = std::ranges::find_if(
            curve, [&, x = in](const auto& p) { return std::abs(Decibels(p.x) - x) < 1e-4; });
        ASSERT_NE(point, curve.end()) << in;
        EXPECT_NEAR(Decibels(point->y), out, 1e-3) << in;
    }
}

#include <gtest/gtest.h>

#include <algorithm>

#include "DSP/Effects/Compressor/CompressorPresets.h"
#include "Support/CompressorProbe.h"

using namespace TestSupport;
using Corvo::DSP::CompressorPrivate::kCompressorPresets;
using Corvo::DSP::CompressorPrivate::TransferCurve;

// What threshold and ratio do to the shapes that are there, and what they read back.
namespace {

// What the effect does, without the remembered words at the chunk's end.
std::vector<std::uint8_t> Record(Compressor& effect) {
    auto chunk = Chunk(effect);
    chunk.resize(16100);
    return chunk;
}

int StepOf(float position) { return static_cast<int>(position * 251.0f); }

double SoftGain(double level, double threshold, double slope, double knee) {
    const double into = std::clamp(level - threshold + knee / 2.0, 0.0, knee);
    return (slope - 1.0) * (into * into / (2.0 * knee) + std::max(level - threshold - knee / 2.0, 0.0));
}

}  // namespace

// Catches a knee that turns hard, loses its width at a ratio of 1 or at the top, or drifts.
TEST(CompressorEdit, SoftKneesMoveAlong) {
    const auto levels = Levels(-90.0, 0.0, 1.7);
    struct Edit {
        int index;  // kThreshold or kRatio
        int word;
    } const edits[] = {{kThreshold, -341}, {kRatio, 0},        {kRatio, 251},     {kThreshold, -10},
                       {kThreshold, -800}, {kRatio, 100},      {kThreshold, -60}, {kRatio, 200},
                       {kRatio, 1},        {kThreshold, -300}, {kRatio, 125}};
    for (const int preset : {1, 3, 17, 20, 40}) {
        const auto& row = kCompressorPresets[static_cast<std::size_t>(preset)];
        double threshold = row.threshold, slope = 1.0 / row.ratio;
        Compressor effect;
        effect.SetPreset(preset);
        SetBoth(effect, kOutGain, OutGainPosition(0));
        SetBoth(effect, kMakeUp, 0.0f);
        SetBoth(effect, kAttack, TimePosition(100));
        for (const auto& edit : edits) {
            if (edit.index == kThreshold) {
                threshold = edit.word / 10.0;
                for (int i = 0; i < 50; ++i) SetBoth(effect, kThreshold, static_cast<float>(i) / 50.0f);
                SetBoth(effect, kThreshold, ThresholdPosition(edit.word));
            } else {
                slope = 1.0 - edit.word / 251.0;
                SetBoth(effect, kRatio, RatioPosition(edit.word));
            }
            const auto gains = SteadyGains(effect, levels, 200);
            for (std::size_t i = 0; i < levels.size(); ++i)
                ASSERT_NEAR(gains[i], SoftGain(levels[i], threshold, slope, row.knee), 0.05)
                    << row.name << " at " << threshold << " dB, slope " << slope << ", level " << levels[i];
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
        const auto* const point =
            std::ranges::find_if(curve, [&](const auto& p) { return std::abs(Decibels(p.x) - in) < 1e-4; });
        ASSERT_NE(point, curve.end()) << in;
        EXPECT_NEAR(Decibels(point->y), out, 1e-3) << in;
    }
}

// Catches a gate that is lost when the knee that pushed it down goes up again.
TEST(CompressorEdit, APushedGateStaysWhereItWasPushed) {
    Compressor effect;
    effect.SetPreset(5);  // gate at -48 dB, 5 dB per dB
    for (const int tenths : {-600, -100}) SetBoth(effect, kThreshold, ThresholdPosition(tenths));
    const auto gains = SteadyGains(effect, {-66.0, -58.0, -12.0});
    EXPECT_NEAR(gains[0], -24.0, 0.1);
    EXPECT_NEAR(gains[1], 0.0, 0.1);
    EXPECT_NEAR(gains[2], 0.0, 0.1);
}

// Catches controls that read back another position than they were set to, or than the curve's text; and one
// that redraws the curve when it is written back.
TEST(CompressorEdit, WritingBackChangesNothing) {
    for (int preset = 0; preset < 42; ++preset)
        for (const bool fromAutomation : {false, true}) {
            Compressor effect;
            effect.SetPreset(preset);
            const auto before = Record(effect);
            const auto texts = Text(effect, kThreshold) + Text(effect, kRatio);
            for (int index = kThreshold; index < kStereoLink; ++index)
                effect.SetParam(index, effect.GetParam(index), fromAutomation);
            EXPECT_EQ(Record(effect), before) << preset;
            EXPECT_EQ(Text(effect, kThreshold) + Text(effect, kRatio), texts);
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

// Catches a mono block that hears one channel of its side-chain only.
TEST(CompressorEdit, AMonoBlockFollowsTheMeanOfAStereoSideChain) {
    const auto format = Format<float>(1);
    constexpr int kFrames = 4000;
    std::vector<float> full(kFrames, 1.0f), silent(kFrames, 0.0f), opposite(kFrames, -1.0f);
    struct Case {
        std::vector<float>*left, *right;
        double gain;  // in dB, under a limiter at -20 dB
        float monitored;
    } const cases[] = {{&silent, &full, -13.979, 0.5f},
                       {&full, &silent, -13.979, 0.5f},
                       {&full, &opposite, -20.0, 0.0f},
                       {&silent, &silent, 0.0, 0.0f}};
    for (const auto& c : cases)
        for (const bool monitor : {false, true}) {
            Compressor effect;
            effect.SetPreset(0);
            SetBoth(effect, kThreshold, ThresholdPosition(-200));
            SetBoth(effect, kRatio, 1.0f);
            SetBoth(effect, kStereoLink, 0.0f);
            SetBoth(effect, kMonitor, monitor ? 1.0f : 0.0f);
            effect.SetSidechainBusNumChannels(0, 2);
            effect.InitProcessing(kFrames, &format);
            double* const channels[] = {reinterpret_cast<double*>(c.left->data()),
                                        reinterpret_cast<double*>(c.right->data())};
            effect.SetSidechainBuffer(0, channels);
            std::vector<float> block(kFrames, 0.001f);
            ProcessBlock(effect, block.data(), kFrames, format);
            if (monitor)
                EXPECT_EQ(block.back(), c.monitored);
            else
                EXPECT_NEAR(Decibels(block.back() / 0.001), c.gain, 0.05);
        }
}

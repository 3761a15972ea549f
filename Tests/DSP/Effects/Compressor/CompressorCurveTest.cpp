#include <gtest/gtest.h>

#include <algorithm>

#include "DSP/Effects/Compressor/CompressorPresets.h"
#include "Support/CompressorProbe.h"

using namespace TestSupport;
using Corvo::DSP::CompressorPrivate::CompressorPreset;
using Corvo::DSP::CompressorPrivate::kCompressorPresets;
using Corvo::DSP::CompressorPrivate::TransferCurve;

// What the curves do to steady levels, and how the parameters edit them.
namespace {

double Ramp(double distance, double width) {
    if (std::abs(distance) < width / 2.0) return std::pow(distance + width / 2.0, 2.0) / (2.0 * width);
    return std::max(distance, 0.0);
}

// The gain that a preset's row means.
double DesignedGain(const CompressorPreset& row, double level) {
    const double reduction = (1.0 - 1.0 / row.ratio) * Ramp(level - row.threshold, row.knee);
    const double gate = (row.gate.slope - 1.0) * Ramp(row.gate.threshold - level, row.gate.knee);
    const double atFullScale = (1.0 - 1.0 / row.ratio) * -row.threshold;
    return row.outGain + (row.autoMakeUp ? std::min(atFullScale, 40.0) : 0.0) - reduction -
           std::min(gate, row.gate.range);
}

// The effect's settings with curves of as many points as there may be, at random places of a bend.
Bytes FullChunk(Compressor& effect, Random& random) {
    std::vector<double> levels{1.0};
    while (levels.size() + 1 < TransferCurve::kMaxPoints) levels.push_back(Amplitude(-90.0 * random.Unit()));
    std::ranges::sort(levels);
    const double slope = 0.3 + 0.7 * random.Unit();
    TransferCurve curve;
    curve.Add(0.0, 0.0);
    for (const double level : levels) curve.Add(level, std::pow(level, slope));
    curve.UpdateSlopes();
    auto chunk = Chunk(effect);
    for (const std::size_t side : {0u, 1u}) {
        Put(chunk, 100 + 4 * side, curve.count);
        Put(chunk, 116 + side * sizeof curve.points, curve.points);
    }
    return chunk;
}

}  // namespace

// Catches a preset that does not do what its row says, and rows that contradict their names.
TEST(CompressorCurve, EveryPresetFollowsItsRow) {
    const auto levels = Levels(-80.0, 0.0, 1.7);
    for (int preset = 0; preset < 42; ++preset) {
        const auto& row = kCompressorPresets[static_cast<std::size_t>(preset)];
        Compressor effect;
        effect.SetPreset(preset);
        const std::string name = row.name;
        const auto gains = SteadyGains(effect, levels);
        bool falls = false;
        for (std::size_t i = 0; i < levels.size(); ++i) {
            EXPECT_NEAR(gains[i], DesignedGain(row, levels[i]), 0.1) << name << " at " << levels[i] << " dB";
            falls = falls || (i > 0 && levels[i] + gains[i] < levels[i - 1] + gains[i - 1] - 1e-6);
        }
        EXPECT_EQ(falls, name == "Inverted dynamic") << name;
    }
}

// Catches edits of the knee that reach the gate under it, and a gate that is lost when the knee that pushed
// it down whole goes up again.
TEST(CompressorCurve, AGateSurvivesTheThreshold) {
    Compressor effect;
    effect.SetPreset(5);  // gate at -48 dB, 5 dB per dB, 50 dB deep; 4:1 above the knee
    struct Case {
        int threshold;
        double open, half;  // the levels at which the gate is open, and at -24 dB
    };
    for (const auto& c :
         {Case{-100, -47.0, -54.0}, {-10, -47.0, -54.0}, {-600, -60.0, -66.0}, {-100, -58.0, -66.0}}) {
        SetBoth(effect, kThreshold, ThresholdPosition(c.threshold));
        const auto gains = SteadyGains(effect, {c.half, c.open, 0.0});
        EXPECT_NEAR(gains[0], -24.0, 0.1) << c.threshold;
        EXPECT_NEAR(gains[1], 0.0, 0.1) << c.threshold;
        EXPECT_NEAR(gains[2], c.threshold / 10.0 * 0.75, 0.1) << "the ratio stays";
    }
}

// Catches a neutral preset that is only nearly neutral, at levels above full scale too.
TEST(CompressorCurve, TheNeutralPresetChangesNoBit) {
    for (const float link : {0.0f, 1.0f}) {
        Compressor effect;
        effect.SetPreset(0);
        effect.SetParam(kStereoLink, link, false);
        const auto input = Noise<double>(2 * 20000, 5.0);
        EXPECT_EQ(Render(effect, input, Format<double>(), {512}), input);
        const auto single = Noise<float>(2 * 20000, 1e-3);
        EXPECT_EQ(Render(effect, single, Format<float>(), {512}), single);
    }
}

// Catches a knee that turns hard, loses its width at a ratio of 1 or at the top, drifts, or is drawn too
// coarsely.
TEST(CompressorCurve, KneesMoveAlong) {
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
                for (int i = 0; i < 1000; ++i) SetBoth(effect, kThreshold, static_cast<float>(i) / 1e3f);
                SetBoth(effect, kThreshold, ThresholdPosition(word));
            } else {
                slope = 1.0 - word / 251.0;
                SetBoth(effect, kRatio, RatioPosition(word));
            }
            const auto gains = SteadyGains(effect, levels, 200);
            for (std::size_t i = 0; i < levels.size(); ++i)
                ASSERT_NEAR(gains[i], (slope - 1.0) * Ramp(levels[i] - threshold, row.knee), 0.05)
                    << row.name << " at " << threshold << " dB, slope " << slope << ", level " << levels[i];
        }
    }
}

// Catches controls that read back another position than they were set to, or than the curve's text; and one
// that redraws the curve when it is written back.
TEST(CompressorCurve, WritingBackChangesNothing) {
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
}

// Catches edits that are heard as a step, where a glide sets out, before or after the last one has ended, or
// arrives; curves of as many points as there may be too. At a rate where a glide is 4100 frames.
TEST(CompressorCurve, EditsDoNotStep) {
    const auto format = Format<double>(2, 8000);
    Random random(5);
    for (int round = 0; round < 90; ++round) {
        SCOPED_TRACE(round);
        const double level = Amplitude(-75.0 * random.Unit());
        Compressor effect;
        effect.SetPreset(random.Below(42));
        SetBoth(effect, kStereoLink, round % 2 == 0 ? 1.0f : 0.0f);
        SetBoth(effect, kAttack, 0.0f);
        effect.InitProcessing(6000, &format);
        std::vector<double> heard;
        for (const int frames : {6000, 900, 300, 6000}) {
            std::vector<double> block(2 * static_cast<std::size_t>(frames), level);
            ProcessBlock(effect, block.data(), frames, format);
            if (!heard.empty()) heard = {heard.back()};
            for (std::size_t i = 1; i < block.size(); i += 2) heard.push_back(block[i]);
            const double loudest = std::ranges::max(heard);
            const auto motion = [&](std::size_t i) { return (heard[i + 1] - heard[i]) / loudest; };
            if (heard.size() > block.size() / 2) {
                ASSERT_NEAR(motion(0), motion(1), 0.011) << frames << " frames";  // 0.1 dB
            }
            for (std::size_t i = 3000; i + 1 < heard.size(); ++i) ASSERT_NEAR(motion(i), 0.0, 1e-6) << i;
            if (const int edit = random.Below(4); edit == 0)
                effect.SetPreset(random.Below(42));
            else if (edit == 1)
                effect.SetSettingsChunk(FullChunk(effect, random));
            else
                SetBoth(effect, edit == 2 ? kThreshold : kRatio, static_cast<float>(random.Unit()));
        }
    }
}

// Catches a bend drawn by hand that an edit flattens. Its threshold is where its straight line begins.
TEST(CompressorCurve, ADrawnBendMovesAlong) {
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

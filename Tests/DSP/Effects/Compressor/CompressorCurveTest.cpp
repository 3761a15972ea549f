#include <gtest/gtest.h>

#include <cstdio>

#include "DSP/Effects/Compressor/CompressorPresets.h"
#include "Support/CompressorProbe.h"

using namespace TestSupport;
using Corvo::DSP::CompressorPrivate::CompressorPreset;
using Corvo::DSP::CompressorPrivate::kCompressorPresets;

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

std::string Formatted(const char* format, double value) {
    char text[32];
    std::snprintf(text, sizeof text, format, value);
    return text;
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
        if (row.ratio != 1.0) {
            EXPECT_EQ(Text(effect, kThreshold + 1), Formatted("%.1f dB", row.threshold)) << name;
            EXPECT_EQ(Text(effect, kRatio), row.ratio > 100.0 ? "Inf.:1 " : Formatted("%.1f:1 ", row.ratio))
                << name;
        }
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

// Catches curves that drift while automation moves them, and edits of one side that reach the other.
TEST(CompressorCurve, StaysPutHoweverOftenItIsEdited) {
    Compressor effect;
    effect.SetPreset(15);  // 8:1, which is between two steps
    const auto right = Text(effect, kRatio + 1) + Text(effect, kThreshold + 1);
    Random random(3);
    for (int i = 0; i < 2000; ++i) effect.SetParam(kThreshold, static_cast<float>(random.Unit()), false);
    effect.SetParam(kThreshold, ThresholdPosition(-200), false);
    EXPECT_EQ(Text(effect, kRatio), "8.0:1 ");
    EXPECT_EQ(Text(effect, kRatio + 1) + Text(effect, kThreshold + 1), right);
    EXPECT_NEAR(SteadyGains(effect, {0.0}).front(), -20.0 * 7.0 / 8.0 + 7.0, 0.05);
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

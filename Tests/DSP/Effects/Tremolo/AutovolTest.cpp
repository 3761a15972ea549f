#include "DSP/Effects/Tremolo/Autovol.h"

#include <gtest/gtest.h>

#include <cmath>

#include "Plain/PlainTremolo.h"
#include "Support/EffectRun.h"

using Corvo::DSP::Autovol;
using TestSupport::Format;
using TestSupport::Render;

namespace {

enum { kDepth, kRate = 2, kMix = 4, kOutGain = 6, kInvert = 8 };
enum Preset { kAutoVol, kLeftPhaseShift, kHardPan = 3, kPedal = 6, kRobot = 7 };

// What the effect makes of a constant 1: the factor itself, frame by frame.
std::vector<double> Factors(Autovol& tremolo, std::size_t frames, int channels = 1) {
    return Render(tremolo, std::vector<double>(frames * static_cast<std::size_t>(channels), 1.0),
                  Format<double>(channels), {512});
}

// Each side against the definition, over blocks that fill no piece of the oscillator.
template <typename Sample>
void ExpectThePlainForm(int channels, int preset, double tolerance) {
    Autovol tremolo;
    tremolo.SetPreset(preset);
    tremolo.SetParam(kRate + 1, 0.77f, false);
    tremolo.SetParam(kOutGain, 0.95f, false);
    const double gains[] = {std::pow(10.0, static_cast<int>(0.95f * 1160.0f - 960.0f) / 200.0), 1.0};
    const double rates[] = {preset == kRobot ? 600.0 : 144.0, static_cast<int>(0.77f * 3000.0f) * 1.0};
    const auto width = static_cast<std::size_t>(channels);
    const auto input = TestSupport::Noise<Sample>(20000 * width, 1.0);
    auto expected = input;
    for (std::size_t side = 0; side < std::min<std::size_t>(width, 2); ++side) {
        const double increment = 0.06283185307179587 * rates[side] / 48000.0, gain = gains[side];
        Plain::Tremolo plain = preset == kRobot
                                   ? Plain::Tremolo{1.0, 0.0, 1.0, 0.0, gain, increment}
                                   : Plain::Tremolo{0.671, 1.0, 1.0 / 1.671, 0.0, gain, increment};
        for (std::size_t at = 0; at < 20000; at += 777)
            plain.Run(expected.data() + at * width + side,
                      static_cast<int>(std::min<std::size_t>(777, 20000 - at)), channels);
    }
    const auto output = Render(tremolo, input, Format<Sample>(channels), {777});
    for (std::size_t i = 0; i < output.size(); ++i)
        ASSERT_NEAR(output[i], expected[i], tolerance) << "sample " << i << " of " << channels;
}

}  // namespace

TEST(Autovol, MatchesThePlainForm) {
    for (const int preset : {kHardPan, kRobot})
        for (const int channels : {1, 2, 3}) {
            ExpectThePlainForm<double>(channels, preset, 1e-12);
            ExpectThePlainForm<float>(channels, preset, 5e-7);  // one rounding at amplitudes up to 6
        }
}

// Catches an oscillator that drifts, and a phase that is rounded in other places than the definition's.
TEST(Autovol, StaysOnTheLibrarysSineForAnHour) {
    Autovol tremolo;
    tremolo.SetPreset(kRobot);
    tremolo.SetParam(kRate, 1.0f, false);
    const auto format = Format<double>(1, 8000);
    const double increment = 0.06283185307179587 * 3000.0 / 8000.0;
    tremolo.InitProcessing(1 << 16, &format);
    std::vector<double> block(1 << 16);
    double phase = 0.0;
    for (int rest = 3600 * 8000; rest > 0; rest -= 1 << 16) {
        std::ranges::fill(block, 1.0);
        TestSupport::ProcessBlock(tremolo, block.data(), 1 << 16, format);
        for (std::size_t i = 0; i < block.size(); ++i) {
            phase += increment;
            if (i % 4096 == 100) {
                ASSERT_NEAR(block[i], std::sin(phase), 1e-9);
            }
        }
        phase = std::fmod(phase, 6.283185307179586);
    }
}

// The swing of the level, from the meaning of depth and mix.
TEST(Autovol, SwingsBetweenTheLevelsThatDepthAndMixPromise) {
    struct Case {
        const char* what;
        int preset;
        float depth, mix;
        double lowest, highest;
    } const cases[] = {
        {"full depth shuts the signal off", kAutoVol, 1.0f, 1.0f, 0.0, 1.0},
        {"half depth", kAutoVol, 0.5f, 0.0f, 1.0 / 3.0, 1.0},
        {"no depth leaves the level", kAutoVol, 0.0f, 0.3f, 1.0, 1.0},
        {"ring modulation", kRobot, 0.2f, 1.0f, -1.0, 1.0},
        {"ring modulation half mixed", kRobot, 1.0f, 0.5f, 0.0, 1.0},
        {"ring modulation mixed out", kRobot, 1.0f, 0.0f, 1.0, 1.0},
    };
    for (const auto& c : cases) {
        Autovol tremolo;
        tremolo.SetPreset(c.preset);
        tremolo.SetParam(kDepth, c.depth, false);
        tremolo.SetParam(kMix, c.mix, false);
        const auto factors = Factors(tremolo, 16000);  // two cycles at 6 Hz
        EXPECT_NEAR(*std::ranges::min_element(factors), c.lowest, 1e-6) << c.what;
        EXPECT_NEAR(*std::ranges::max_element(factors), c.highest, 1e-6) << c.what;
        // A quarter of a cycle after the start the sine is at its top: the highest level.
        EXPECT_NEAR(factors[1999], c.highest, 1e-9) << c.what;
    }
}

TEST(Autovol, KeepsThePhaseThroughEditsAndDropsItOnPreparation) {
    Autovol tremolo;
    const auto format = Format<double>(1);
    const auto quarter = Factors(tremolo, 2000);  // the phase is now a quarter of a cycle
    tremolo.SetParam(kRate, 0.0f, false);
    double still[] = {1.0, 1.0};
    TestSupport::ProcessBlock(tremolo, still, 2, format);
    EXPECT_NEAR(still[0], 1.0, 1e-12) << "stands at the top";
    EXPECT_EQ(still[0], still[1]);
    EXPECT_NEAR(Factors(tremolo, 2)[1], 0.5, 1e-12) << "prepared afresh, it stands at the start";

    tremolo.SetPreset(kLeftPhaseShift);
    const auto flipped = Factors(tremolo, 10, 2);
    for (std::size_t i = 0; i < flipped.size(); i += 2) {
        EXPECT_EQ(flipped[i], -1.0);
        EXPECT_EQ(flipped[i + 1], 1.0);
    }
}

TEST(Autovol, ShowsItsValues) {
    struct Case {
        int index;
        double value;
        const wchar_t* text;
    } const cases[] = {
        {kDepth, 0.1239, L"12.3 %"},   {kRate, 0.2, L"6.0 Hz"},        {kMix + 1, 1.0, L"100.0 %"},
        {kOutGain, 0.0, L"-Inf. dB"},  {kOutGain, 0.001, L"-95.8 dB"}, {kOutGain, 1.0, L"20.0 dB"},
        {kInvert, 0.0, L"Disabled "},  {kInvert, 0.99, L"Enabled "},   {kInvert + 1, 1.0, L"Enabled "},
        {kOutGain, 0.826, L"-0.1 dB"},
    };
    Autovol tremolo;
    for (const auto& c : cases)
        EXPECT_EQ(tremolo.GetParameterFormattedText(c.index, c.value), c.text)
            << c.index << " at " << c.value;
    tremolo.SetParam(kInvert, 0.99f, false);
    EXPECT_EQ(tremolo.GetParam(kInvert), 0.0f) << "only the end of the knob inverts";
    EXPECT_EQ(tremolo.GetParamValueNormalizedFromText(kInvert, "enabled"), 1.0f);
    EXPECT_EQ(tremolo.GetParamValueNormalizedFromText(kInvert, "upside down"), -1.0f);
    EXPECT_EQ(tremolo.GetParameterAvailableValues(kInvert),
              (std::vector<std::string>{"Disabled", "Enabled"}));
    EXPECT_EQ(tremolo.GetParamName(kInvert), L"Invert Phase");
    EXPECT_EQ(tremolo.GetParametersInfo()[kInvert].mpdNeutralValue, 0.0f);
    GenericUIData data;
    tremolo.InitializeXyEditingData(data);
    ASSERT_EQ(data.groups.size(), 2u);
    EXPECT_EQ(data.groups[1].x_axis, (std::vector{kDepth + 1, kRate + 1}));
    EXPECT_EQ(data.groups[1].y_axis, (std::vector{kMix + 1, kOutGain + 1}));
}

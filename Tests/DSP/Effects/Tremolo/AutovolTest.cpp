#include "DSP/Effects/Tremolo/Autovol.h"

#include <gtest/gtest.h>

#include <cmath>

#include "Support/EffectRun.h"

using Corvo::DSP::Autovol;
using TestSupport::Format;
using TestSupport::Render;

namespace {

enum { kDepth, kRate = 2, kMix = 4, kOutGain = 6, kInvert = 8 };
enum Preset { kAutoVol, kLeftPhaseShift, kHardPan = 3, kRobot = 7 };

// What the effect makes of a constant 1: the factor itself, frame by frame.
std::vector<double> Factors(Autovol& tremolo, std::size_t frames, int channels = 1) {
    return Render(tremolo, std::vector<double>(frames * static_cast<std::size_t>(channels), 1.0),
                  Format<double>(channels), {512});
}

}  // namespace

// Catches sides mixed up, a third channel touched, an oscillator that drifts or loses its place in a block.
TEST(Autovol, MultipliesEachSideByItsOwnSine) {
    const auto check = []<typename Sample>(Sample, int channels, int preset, double tolerance) {
        Autovol tremolo;
        tremolo.SetPreset(preset);
        tremolo.SetParam(kRate + 1, 0.77f, false);
        tremolo.SetParam(kOutGain, 0.95f, false);
        const bool ring = preset == kRobot;
        const double gains[] = {std::pow(10.0, 14.2 / 20.0), 1.0}, hertz[] = {ring ? 6.0 : 1.44, 23.1};
        const auto width = static_cast<std::size_t>(channels);
        const auto input = TestSupport::Noise<Sample>(20000 * width, 1.0);
        const auto output = Render(tremolo, input, Format<Sample>(channels), {777});
        for (std::size_t i = 0; i < output.size(); ++i) {
            const std::size_t side = i % width;
            double factor = 1.0;
            if (side < 2) {
                const double sine =
                    std::sin(6.283185307179586 * hertz[side] / 48000.0 * static_cast<double>(i / width + 1));
                factor = (ring ? sine : (0.671 * sine + 1.0) / 1.671) * gains[side];
            }
            ASSERT_NEAR(output[i], input[i] * factor, tolerance) << "sample " << i << " of " << channels;
        }
    };
    for (const int preset : {kHardPan, kRobot})
        for (const int channels : {1, 2, 3}) {
            check(0.0, channels, preset, 1e-10);
            check(0.0f, channels, preset, 5e-7);  // one rounding at amplitudes up to 6
        }
}

// The swing of the level, from the meaning of depth and mix.
TEST(Autovol, SwingsBetweenTheLevelsThatDepthAndMixPromise) {
    struct Case {
        const char* what;
        int preset;
        float depth, mix, invert;
        double lowest, highest, top;  // the last: where the sine is at its top
    } const cases[] = {
        {"full depth shuts the signal off", kAutoVol, 1.0f, 1.0f, 0.0f, 0.0, 1.0, 1.0},
        {"half depth", kAutoVol, 0.5f, 0.0f, 0.0f, 1.0 / 3.0, 1.0, 1.0},
        {"no depth leaves the level", kAutoVol, 0.0f, 0.3f, 0.0f, 1.0, 1.0, 1.0},
        {"half depth, inverted", kAutoVol, 0.5f, 0.0f, 1.0f, -1.0, -1.0 / 3.0, -1.0},
        {"ring modulation", kRobot, 0.2f, 1.0f, 0.0f, -1.0, 1.0, 1.0},
        {"ring modulation half mixed", kRobot, 1.0f, 0.5f, 0.0f, 0.0, 1.0, 1.0},
        {"ring modulation mixed out", kRobot, 1.0f, 0.0f, 0.0f, 1.0, 1.0, 1.0},
        {"the part that is not modulated is inverted too", kRobot, 1.0f, 0.25f, 1.0f, -1.0, -0.5, -1.0},
    };
    for (const auto& c : cases) {
        Autovol tremolo;
        tremolo.SetPreset(c.preset);
        tremolo.SetParam(kDepth, c.depth, false);
        tremolo.SetParam(kMix, c.mix, false);
        tremolo.SetParam(kInvert, c.invert, false);
        const auto factors = Factors(tremolo, 16000);  // two cycles at 6 Hz
        EXPECT_NEAR(*std::ranges::min_element(factors), c.lowest, 1e-6) << c.what;
        EXPECT_NEAR(*std::ranges::max_element(factors), c.highest, 1e-6) << c.what;
        EXPECT_NEAR(factors[1999], c.top, 1e-9) << c.what;
    }
}

TEST(Autovol, KeepsThePhaseThroughEditsAndDropsItOnPreparation) {
    Autovol tremolo;
    const auto format = Format<double>(1);
    Factors(tremolo, 2000);  // the phase is now a quarter of a cycle
    tremolo.SetParam(kRate, 0.0f, false);
    double still[] = {1.0, 1.0};
    TestSupport::ProcessBlock(tremolo, still, 2, format);
    EXPECT_NEAR(still[0], 1.0, 1e-12) << "stands at the top";
    EXPECT_EQ(still[0], still[1]);
    EXPECT_NEAR(Factors(tremolo, 2)[1], 0.5, 1e-12) << "prepared afresh, it stands at the start";

    tremolo.SetPreset(kLeftPhaseShift);
    EXPECT_EQ(Factors(tremolo, 2, 2), (std::vector{-1.0, 1.0, -1.0, 1.0}));
}

#include "DSP/Effects/Tremolo/Autovol.h"

#include <gtest/gtest.h>

#include <cmath>

#include "Support/EffectRun.h"

using Corvo::DSP::Autovol;
using namespace TestSupport;

namespace {

enum { kDepth, kRate = 2, kMix = 4, kOutGain = 6, kInvert = 8 };
enum Preset { kAutoVol, kRobot = 7 };

}  // namespace

// From the meaning of depth and mix. Catches sides mixed up, a third channel touched, an oscillator that
// drifts or loses its place in a block.
TEST(Autovol, MultipliesEachSideByItsOwnSine) {
    struct Case {
        const char* what;
        int preset;
        float depth, mix, invert;  // in whole thousandths
    } const cases[] = {
        {"full depth shuts the signal off", kAutoVol, 1.0f, 1.0f, 0.0f},
        {"no depth leaves the level", kAutoVol, 0.0f, 0.3f, 0.0f},
        {"ring modulation half mixed", kRobot, 1.0f, 0.5f, 0.0f},
        {"the part that is not modulated is inverted too", kRobot, 1.0f, 0.25f, 1.0f},
    };
    const auto check = []<typename Sample>(Sample, const Case& c, int channels, double tolerance) {
        Autovol tremolo;
        tremolo.SetPreset(c.preset);
        SetBoth(tremolo, kDepth, c.depth);
        SetBoth(tremolo, kMix, c.mix);
        tremolo.SetParam(kInvert, c.invert, false);
        tremolo.SetParam(kRate + 1, 0.77f, false);
        tremolo.SetParam(kOutGain, 0.95f, false);
        const double left = std::pow(10.0, 14.2 / 20.0), gains[] = {c.invert > 0.0f ? -left : left, 1.0};
        const double hertz[] = {6.0, 23.1}, depth = c.depth, mix = c.mix;
        const auto width = static_cast<std::size_t>(channels);
        const auto input = Noise<Sample>(20000 * width, 1.0);
        const auto output = Render(tremolo, input, Format<Sample>(channels), {777});
        for (std::size_t i = 0; i < output.size(); ++i) {
            const std::size_t side = i % width;
            const double turns = hertz[side % 2] / 48000.0 * static_cast<double>(i / width + 1);
            const double sine = std::sin(2.0 * std::numbers::pi * turns);
            const double swing =
                c.preset == kRobot ? mix * sine + 1.0 - mix : (depth * sine + 1.0) / (1.0 + depth);
            const double factor = side < 2 ? swing * gains[side] : 1.0;
            ASSERT_NEAR(output[i], input[i] * factor, tolerance)
                << c.what << ", sample " << i << " of " << channels;
        }
    };
    for (const auto& c : cases)
        for (const int channels : {1, 2, 3}) {
            check(0.0, c, channels, 1e-7);
            check(0.0f, c, channels, 5e-7);  // one rounding at amplitudes up to 6
        }
}

TEST(Autovol, KeepsThePhaseThroughEditsAndDropsItOnPreparation) {
    Autovol tremolo;
    const auto format = Format<double>(1);
    const auto run = [&](std::vector<double> ones) { return Render(tremolo, ones, format, {512}); };
    run(std::vector(2000, 1.0));  // the phase is now a quarter of a cycle
    tremolo.SetParam(kRate, 0.0f, false);
    double still[] = {1.0, 1.0};
    ProcessBlock(tremolo, still, 2, format);
    EXPECT_NEAR(still[0], 1.0, 1e-12) << "stands at the top";
    EXPECT_EQ(still[0], still[1]);
    EXPECT_NEAR(run({1.0, 1.0})[1], 0.5, 1e-12) << "prepared afresh, it stands at the start";
}

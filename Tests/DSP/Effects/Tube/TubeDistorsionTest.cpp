#include "DSP/Effects/Tube/TubeDistorsion.h"

#include <gtest/gtest.h>

#include <complex>

#include "Plain/PlainTube.h"
#include "Support/EffectRun.h"

using namespace TestSupport;
using Corvo::DSP::TubeDistorsion;

namespace {

enum Control { kBoost = 0, kDrive = 2, kTone = 4, kFunction = 6, kOversampling = 8 };

// Stereo noise that reaches every branch of the functions.
const auto kNoise = Noise<double>(2 * 1500, 1.2);

std::vector<double> RenderNoise(TubeDistorsion& tube) {
    return Render(tube, kNoise, Format<double>(), {128});
}

struct Side {
    float boost, drive;
    int function;
};

}  // namespace

// Catches a wrong constant or branch, lanes that take the other side's values, and a mix-up of the factors.
TEST(TubeDistorsionTest, ShapesLikeThePlainForm) {
    constexpr struct {
        Side sides[2];
        float oversampling;
        int factor;
    } kCases[] = {
        {{{0.1f, 0.3f, 0}, {0.1f, 0.3f, 0}}, 0.0f, 1},   {{{0.0f, 0.6f, 1}, {0.0f, 0.9f, 1}}, 0.17f, 1},
        {{{0.05f, 0.5f, 2}, {0.2f, 0.1f, 2}}, 0.0f, 1},  {{{0.0f, 0.2f, 3}, {0.0f, 0.7f, 3}}, 0.0f, 1},
        {{{0.0f, 0.3f, 3}, {0.0f, 1.0f, 3}}, 0.0f, 1},   {{{0.3f, 0.4f, 0}, {0.0f, 0.8f, 2}}, 0.0f, 1},
        {{{0.3f, 0.0f, 0}, {0.0f, 0.8f, 1}}, 0.0f, 1},   {{{0.1f, 0.3f, 0}, {0.0f, 0.6f, 1}}, 0.3f, 2},
        {{{0.1f, 0.3f, 1}, {0.1f, 0.3f, 1}}, 0.5f, 4},   {{{0.1f, 0.5f, 2}, {0.1f, 0.3f, 3}}, 0.7f, 8},
        {{{0.1f, 0.5f, 3}, {0.1f, 0.3f, 3}}, 0.75f, 12}, {{{0.1f, 0.3f, 0}, {0.1f, 0.3f, 0}}, 0.8f, 16},
    };
    TubeDistorsion untouched;
    EXPECT_EQ(RenderNoise(untouched), kNoise);
    for (const auto& c : kCases) {
        TubeDistorsion tube;
        for (const int side : {0, 1}) {
            const auto& [boost, drive, function] = c.sides[side];
            tube.SetParam(kBoost + side, boost, false);
            tube.SetParam(kDrive + side, drive, false);
            tube.SetParam(kFunction + side, 0.25f * static_cast<float>(function), false);
        }
        // The left one is kept, and that is all.
        tube.SetParam(kOversampling, 0.6f, false);
        tube.SetParam(kOversampling + 1, c.oversampling, false);
        const auto output = RenderNoise(tube);
        for (std::size_t side = 0; side < 2; ++side) {
            const auto& [boost, drive, function] = c.sides[side];
            const auto actual = Channel(output, side);
            const auto expected = Plain::Tube(Channel(kNoise, side), 10.0 * static_cast<double>(boost) + 1.0,
                                              function, static_cast<double>(drive), c.factor);
            // Boost and drive are floats; "Martens" multiplies their rounding by its factor.
            for (std::size_t i = 0; i < actual.size(); ++i)
                ASSERT_NEAR(actual[i], expected[i], 2e-6) << c.factor << ", side " << side << ", frame " << i;
        }
    }
}

// At drive 0.9901 the sine is 1 and its shape factor would be infinite.
TEST(TubeDistorsionTest, MartensStaysFiniteAtItsSteepest) {
    for (float drive = 0.9890f; drive < 0.9912f; drive += 0.00001f) {
        TubeDistorsion tube;
        SetBoth(tube, kDrive, drive);
        const auto output = Render<double>(tube, {0.0, 0.0, 0.5, -0.5}, Format<double>(), {2});
        EXPECT_EQ(output[0], 0.0);
        EXPECT_NEAR(output[2], 1.0, 1e-4) << drive;
    }
}

// The filter's response against the four sections' product; -12 dB at its corner. Off above 3 radians.
TEST(TubeDistorsionTest, ToneIsALowPassOfOrderFour) {
    const auto z = [](double radians) { return std::polar(1.0, -radians); };
    for (const float v : {0.0f, 0.4f, 0.8f, 0.9f}) {
        TubeDistorsion tube;
        SetBoth(tube, kTone, v);
        std::vector<double> impulse(2 * 2000);
        impulse[0] = 1.0;
        const auto response = Channel(Render(tube, impulse, Format<double>(), {100}), 0);
        const double corner = (1.0 - static_cast<double>(v)) * 0.35 + static_cast<double>(v) * 3.5;
        for (const double radians : {0.0, 0.2, std::min(corner, 3.0), 2.0}) {
            const double k = std::tan(corner / 2);
            const auto section = (k + k * z(radians)) / (1.0 + k + (k - 1.0) * z(radians));
            const auto expected = corner > 3.0 ? 1.0 : section * section * section * section;
            EXPECT_NEAR(std::abs(TransformAt(response, radians / (2.0 * std::numbers::pi)) - expected), 0.0,
                        1e-5)
                << v << " at " << radians;
        }
    }
}

TEST(TubeDistorsionTest, FloatsInMonoGetTheSame) {
    TubeDistorsion stereo, mono;
    for (auto* tube : {&stereo, &mono}) tube->SetPreset(3);
    const auto expected = Channel(RenderNoise(stereo), 0), input = Channel(kNoise, 0);
    const auto single = Render<float>(mono, {input.begin(), input.end()}, Format<float>(1), {128});
    // "70s Muff" amplifies small samples about 40 times.
    for (std::size_t i = 0; i < single.size(); ++i)
        ASSERT_NEAR(static_cast<double>(single[i]), expected[i], 2e-5);
}

// A change of the factor in mid-stream: the new filters must come in warm, so that a slow sine goes on
// without a step. The latency of all factors from 2 is within a frame.
TEST(TubeDistorsionTest, ChangesItsFactorWithoutAClick) {
    TubeDistorsion tube;
    SetBoth(tube, kDrive, 0.4f);
    // From 2 to 16 and back: every pair of neighbours in both directions. The blocks are no divisor of the
    // frames kept for warming up.
    constexpr float kSettings[] = {0.3f, 0.5f, 0.6f, 0.75f, 1.0f, 0.75f, 0.6f, 0.5f};
    tube.SetParam(kOversampling + 1, kSettings[0], false);
    std::vector<Edit> edits;
    for (std::size_t i = 1; i < 50; ++i) edits.push_back({100 * i, kOversampling + 1, kSettings[i % 8]});
    const auto output =
        Channel(Render(tube, Sine<double>(5000, 100.0, 48000, 0.3, 2), Format<double>(), {50}, edits), 0);
    double steepest = 0.0;
    for (std::size_t i = 50; i < output.size(); ++i)
        steepest = std::max(steepest, std::abs(output[i] - output[i - 1]));
    // The curve's own slope: 2 pi 100 / 48000 * 0.3 * (k + 1) with k = 2.96 is 0.0155 a frame, and up to
    // twice that where the latency changes; a filter that starts from silence steps by the whole signal.
    EXPECT_LT(steepest, 0.031);
    EXPECT_GT(steepest, 0.01);
}

TEST(TubeDistorsionTest, LatencyIsTheDelayOfBothFilters) {
    TubeDistorsion tube;
    EXPECT_EQ(tube.GetLatency(), 0);
    SetBoth(tube, kOversampling, 1.0f);
    std::vector<double> ramp(2 * 400);
    for (std::size_t i = 0; i < ramp.size(); ++i) ramp[i] = static_cast<double>(i / 2) * 1e-3;
    const auto output = Render(tube, ramp, Format<double>(), {400});
    EXPECT_EQ(tube.GetLatency(), std::lround((ramp.back() - output.back()) / 1e-3));
}

#include "DSP/Effects/Phaser/Phaser.h"

#include <gtest/gtest.h>

#include <bit>
#include <cmath>
#include <complex>
#include <numbers>

#include "Plain/PlainPhaser.h"
#include "Support/EffectRun.h"

using Corvo::DSP::Phaser;
using TestSupport::Format;
using TestSupport::Render;

namespace {

enum { kFeedback = 1, kWidth = 5, kStages };

// The settings in the order of the chunk.
struct Settings {
    float rate, feedback, wet, maximum, minimum, width;
    std::int32_t stages;
};

std::vector<std::uint8_t> MakeChunk(const Settings& s) {
    std::vector<std::uint8_t> chunk(4);
    const auto put = [&](std::uint32_t bits) {
        for (int shift = 0; shift < 32; shift += 8) chunk.push_back(static_cast<std::uint8_t>(bits >> shift));
    };
    for (const float value : {s.rate, s.feedback, s.wet, s.maximum, s.minimum, s.width})
        put(std::bit_cast<std::uint32_t>(value));
    put(static_cast<std::uint32_t>(s.stages));
    return chunk;
}

Plain::Phaser PlainOf(const Settings& s, int rate) {
    return {rate, s.rate, s.feedback, s.wet, s.minimum, s.maximum, static_cast<std::size_t>(s.stages)};
}

std::vector<double> ImpulseResponse(const Settings& settings, std::size_t frames) {
    Phaser phaser;
    phaser.SetSettingsChunk(MakeChunk(settings));
    std::vector<double> impulse(frames);
    impulse[0] = 1.0;
    return Render(phaser, impulse, Format<double>(1), {512});
}

double Magnitude(const std::vector<double>& response, double omega) {
    const auto turn = std::polar(1.0, omega);
    std::complex<double> sum;
    for (auto sample = response.rbegin(); sample != response.rend(); ++sample) sum = sum * turn + *sample;
    return std::abs(sum);
}

}  // namespace

// Catches lanes that are swapped, a rounding left out or added, and a sweep that wraps in another place.
TEST(Phaser, HasTheBitsOfThePlainForm) {
    const Settings cases[] = {
        {1.0f, 0.7f, 0.5f, 1600, 440, 0.25f, 6},      {0.6667f, 0.97f, 0.65f, 10000, 0, 1.0f, 30},
        {0.168f, 0.685f, 0.303f, 680, 4120, 0.1f, 1}, {0.05f, 0.7f, 1.0f, 1600, 440, 0.0f, 0},
        {0.0f, 0.5f, 0.5f, 700, 700, 0.5f, 12},       {0.3f, 0.5f, 0.0f, 700, 900, 0.5f, 30},
    };
    const auto check = [&]<typename Sample>(Sample, const Settings& s, int channels, int rate) {
        constexpr std::size_t kFrames = 30000;
        const auto width = static_cast<std::size_t>(channels);
        const auto input = TestSupport::Noise<Sample>(kFrames * width);
        auto expected = input;
        for (std::size_t c = 0; c < std::min<std::size_t>(width, 2); ++c) {
            auto plain = PlainOf(s, rate);
            if (c == 1) plain.phase = s.width * 6.283185307179586;
            plain.Run(expected.data() + c, kFrames, channels);
        }
        Phaser phaser;
        phaser.SetSettingsChunk(MakeChunk(s));
        ASSERT_EQ(Render(phaser, input, Format<Sample>(channels, rate), {500, 1, 64, 1023}), expected)
            << s.stages << " stages, " << channels << " channels";
    };
    for (const auto& s : cases)
        for (const int channels : {1, 2, 3}) {
            check(0.0f, s, channels, 48000);
            check(0.0, s, channels, 8000);
        }
}

// The chain turns the phase by 2 atan(tan(omega / 2) / w) per stage, so that chain and dry signal cancel
// wherever that makes an odd number of half turns. With n stages that is n / 2 times below half the rate.
TEST(Phaser, HasItsNotchesWhereTheChainTurnsThePhase) {
    for (const int stages : {1, 6, 30}) {
        const double w = 2400.0 / 24000.0;
        const auto response = ImpulseResponse({0.0f, 0.0f, 0.5f, 2400, 2400, 0.0f, stages}, 4000);
        const auto omegaFor = [&](double turn) { return 2 * std::atan(w * std::tan(turn / 2)); };
        int notches = 0;
        for (int k = 0; 2 * k + 1 < stages; ++k) {
            EXPECT_LT(Magnitude(response, omegaFor((2 * k + 1) * std::numbers::pi / stages)), 1e-4) << k;
            EXPECT_NEAR(Magnitude(response, omegaFor(2 * k * std::numbers::pi / stages)), 2.0, 1e-4) << k;
        }
        double before = 2.0, last = 2.0;
        for (int i = 1; i < 600; ++i) {
            const double here = Magnitude(response, omegaFor(i * std::numbers::pi / 600));
            notches += last < 0.1 && last < before && last < here;
            before = std::exchange(last, here);
        }
        EXPECT_EQ(notches, stages / 2);
    }
}

// Catches a right sweep that is put back by every cook, and one that does not follow the width.
TEST(Phaser, MovesTheRightSweepOnlyWithTheWidth) {
    const Settings s{0.5f, 0.3f, 0.5f, 4000, 300, 0.25f, 4};
    Phaser phaser;
    phaser.SetSettingsChunk(MakeChunk(s));
    auto left = PlainOf(s, 48000), right = left;
    right.phase = 0.25 * 6.283185307179586;
    const auto format = Format<double>();
    phaser.InitProcessing(13000, &format);
    const auto run = [&](const char* what) {
        auto block = TestSupport::Noise<double>(2 * 13000);
        auto expected = block;
        left.Run(expected.data(), 13000, 2);
        right.Run(expected.data() + 1, 13000, 2);
        TestSupport::ProcessBlock(phaser, block.data(), 13000, format);
        EXPECT_EQ(block, expected) << what;
    };
    run("from the start");
    phaser.SetParam(kFeedback, 0.5f, false);
    left.feedback = right.feedback = 0.5;
    run("after another edit");
    phaser.SetParam(kWidth, 0.75f, false);
    right.phase = left.phase + 0.75 * 6.283185307179586;
    run("after the width");
}

TEST(Phaser, CountsItsStages) {
    Phaser phaser;
    EXPECT_EQ(phaser.GetParameterFormattedText(kStages, 0.0), L"0") << "presets have none";
    for (const auto& [value, stages] :
         {std::pair{0.0344f, 1.0f}, {1.0f / 29.0f, 2.0f}, {0.9999f, 29.0f}, {2.0f, 30.0f}, {-1.0f, 1.0f}}) {
        phaser.SetParam(kStages, value, false);
        EXPECT_EQ(phaser.GetParamPlain(kStages), stages) << value;
    }
}

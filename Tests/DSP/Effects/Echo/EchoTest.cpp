#include "DSP/Effects/Echo/Echo.h"

#include <gtest/gtest.h>

#include <climits>
#include <cmath>
#include <tuple>

#include "Plain/PlainEcho.h"
#include "Platform/DenormalGuard.h"
#include "Support/EffectRun.h"

using namespace Corvo::DSP;
using namespace TestSupport;

namespace {

enum { kDepthL, kMode = 2, kModeR };

struct Host : CorvoEffectHostCallback {
    Host(double tempo = 120.0, int above = 4, int below = 4) : bpm(tempo), signature(above, below) {}
    double GetTempo() override { return bpm; }
    void GetTimeSignature(int& above, int& below) override { std::tie(above, below) = signature; }
    double bpm;
    std::pair<int, int> signature;
};

// Mode and depths left and right; decay -6 dB left and -12 dB right, echo gain 0 dB, all wet, output 0 dB.
void Load(Echo& echo, std::int32_t mode, std::int32_t left, std::int32_t right) {
    std::vector<std::int32_t> words{0, -60, -120, 2000, 2000, left, right};
    words.resize(23);
    words.insert(words.end(), {mode, mode});
    LoadWords(echo, words);
}

}  // namespace

// Catches a wrong note, curve or unit, and a tap that is late or has the wrong gain.
TEST(Echo, RepeatsAnImpulseAfterTheDelayOfEveryMode) {
    struct {
        const char* what;
        std::int32_t mode, depth;
        Host host;
        double ms;
    } cases[] = {
        {"linear, every word its millisecond", 0, 1009, {}, 1009.0},
        {"log, middle", 1, 5000, {}, 19.0 + std::sqrt(4980.0)},
        {"eighth of a bar's quarter", 2, 6999, {}, 125.0},
        {"beat triplet: a third", 3, 8500, {}, 500.0 / 3.0},
        {"beat dotted", 4, 8999, {}, 750.0},
        {"measure of 3/8", 2, 10000, {240.0, 3, 8}, 375.0},
        {"no denominator counts as 4", 2, 10000, {240.0, 3, 0}, 750.0},
        {"no number counts as 120", 2, 8000, {NAN}, 500.0},
        {"at least 10 samples", 0, 0, {}, 10.0 / 48.0},
        {"an unknown mode is a millisecond", 7, 5000, {}, 1.0},
        {"a word from nowhere is the longest time", 0, INT_MAX, {}, 10000.0},
    };
    const auto format = Format<double>();
    for (auto& c : cases) {
        Echo echo;
        echo.SetHostCallback(&c.host);
        Load(echo, c.mode, c.depth, c.depth);
        // The ring counts both channels' samples; constants rounded to single precision lose one at most.
        const double frames = c.ms * 48.0 / 2.0;
        std::vector<double> samples(2 * static_cast<std::size_t>(2.0 * frames + 8));
        samples[0] = samples[1] = 1.0;
        samples = Render(echo, samples, format, {512});
        for (std::size_t side = 0; side < 2; ++side) {
            const double back = std::pow(10.0, side == 0 ? -0.3 : -0.6);
            std::vector<std::size_t> taps;
            for (std::size_t i = 1; i < samples.size() / 2; ++i)
                if (samples[2 * i + side] != 0.0) taps.push_back(i);
            ASSERT_GE(taps.size(), 2u) << c.what;
            EXPECT_NEAR(static_cast<double>(taps[0]), frames, 1.0) << c.what;
            EXPECT_EQ(taps[1], 2 * taps[0]) << c.what;
            EXPECT_NEAR(samples[2 * taps[0] + side], 1.0 + back, 1e-12) << c.what;
            EXPECT_NEAR(samples[2 * taps[1] + side], (1.0 + back) * back, 1e-7) << c.what;
        }
    }
}

// Catches lanes mixed up, a run over a wrap, and a ring that forgets or keeps what it should not when a
// delay changes.
TEST(Echo, HasTheBitsOfThePlainOne) {
    const auto check = []<typename Sample>(Sample, int channels) {
        constexpr int kFrames = 700;
        const auto format = Format<Sample>(channels, 1000);  // a word of the linear mode is a sample
        const std::array<int, 2> depths[] = {{400, 400}, {401, 401}, {30, 401},  {401, 12},
                                             {10, 11},   {13, 13},   {600, 601}, {601, 600}};
        Echo echo;
        Plain::Echo plain;
        echo.InitProcessing(kFrames, &format);
        std::uint64_t seed = 1;
        for (const auto& [left, right] : depths) {
            Load(echo, 0, left, right);
            plain.SetSides({{{std::pow(10.0, -0.3), 1.0, 1.0, 1.0, left},
                             {std::pow(10.0, -0.6), 1.0, 1.0, 1.0, right}}});
            auto samples = Noise<Sample>(static_cast<std::size_t>(channels * kFrames), 0.25, ++seed);
            auto expected = samples;
            ProcessBlock(echo, samples.data(), kFrames, format);
            const Corvo::DenormalGuard guard;
            plain.Run(expected.data(), kFrames, static_cast<std::size_t>(channels));
            ASSERT_EQ(samples, expected) << channels << " channels, " << left << " and " << right;
        }
    };
    for (const int channels : {1, 2}) {
        check(0.0, channels);
        check(0.0f, channels);
    }
}

// Catches names that stand for another note; what is shown is also what is parsed.
TEST(Echo, NamesItsNotes) {
    Echo echo;
    for (const auto& [mode, value, text] : {std::tuple{2, 0.05f, "1/256 (1 ms)"},
                                            {2, 1.0f, "Measure (2000 ms)"},
                                            {4, 0.7f, "1/2 Dot (374 ms)"}}) {
        Load(echo, mode, 0, 0);
        EXPECT_EQ(Text(echo, kDepthL, value), text);
        EXPECT_EQ(Text(echo, kDepthL, echo.GetParamValueNormalizedFromText(kDepthL, text)), text);
    }
}

// Catches a delay that jumps when the mode does, and the odd rule for choosing the same mode again.
TEST(Echo, KeepsTheDelayWhenTheModeBecomesATime) {
    const auto log = [](double ms) {
        return static_cast<std::int32_t>(1.0 + 1174.6484375 * std::log(ms - 19.0));
    };
    const struct {
        const char* what;
        std::int32_t from, to;
        std::array<std::int32_t, 2> before, after;  // the words, left and right
    } cases[] = {
        {"linear to log, beyond its knob", 0, 1, {10000, 300}, {log(10000), log(300)}},
        {"below 20 ms there is no logarithm", 0, 1, {7, 19}, {1, 1}},
        {"log to linear", 1, 0, {0, 10000}, {20, 4999}},
        {"dotted to log", 4, 1, {8000, 6000}, {log(749.9999), log(187.499975)}},
        {"to a note: the words stay", 0, 3, {300, 120}, {300, 120}},
        {"linear again: right becomes left", 0, 0, {300, 120}, {300, 300}},
        {"note again: the words stay", 2, 2, {300, 120}, {300, 120}},
    };
    for (const auto& c : cases) {
        Echo echo;
        Load(echo, c.from, c.before[0], c.before[1]);
        for (const int side : {kModeR, kMode}) echo.SetParam(side, static_cast<float>(c.to) / 4.0f, false);
        EXPECT_EQ((At<std::array<std::int32_t, 2>>(Chunk(echo), 20)), c.after) << c.what;
    }
}

#include "DSP/Effects/Chorus/Chorus.h"

#include <gtest/gtest.h>

#include <climits>

#include "Plain/PlainChorus.h"
#include "Support/EffectRun.h"

using Corvo::DSP::Chorus;
using namespace TestSupport;

namespace {

void Load(Chorus& chorus, const Plain::Chorus::Settings& s) {
    std::vector<std::int32_t> words{0};
    for (const auto& [left, right] : {s.frequency, s.delay, s.wet, s.dry, s.depth})
        words.insert(words.end(), {left, right});
    LoadWords(chorus, words);
}

Plain::Chorus::Settings Both(int frequency, int delay, int wet, int dry, int depth) {
    return {{frequency, frequency}, {delay, delay}, {wet, wet}, {dry, dry}, {depth, depth}};
}

}  // namespace

// Catches a wrong wrap, a ring that loses its contents or its place when an edit makes it longer or shorter,
// and channels that read each other's samples.
TEST(Chorus, MatchesThePlainFormThroughEditsOfTheRing) {
    const Plain::Chorus::Settings steps[] = {
        Both(80, 400, -44, -60, 30),
        {{39, 23}, {20, 30}, {-30, -30}, {-30, -30}, {1000, 1000}},
        {{300, 200}, {3750, 40}, {0, -959}, {-960, 20}, {712, 0}},
        {{10, 300}, {7, 2000}, {0, 0}, {0, -960}, {1000, 301}},
        Both(300, 1, 0, 0, 1000),
        Both(90, 30, 0, -960, 718),
    };
    const auto check = [&]<typename Sample>(Sample, int channels, double tolerance) {
        const auto format = Format<Sample>(channels);
        Chorus chorus;
        Plain::Chorus plain;
        chorus.InitProcessing(512, &format);
        plain.Cook(steps[0], 48000, channels, true);
        for (std::size_t step = 0; step < std::size(steps); ++step) {
            Load(chorus, steps[step]);
            const bool afresh = step == 3;
            if (afresh) chorus.InitProcessing(512, &format);
            plain.Cook(steps[step], 48000, channels, afresh);
            for (std::uint64_t block = 0; block < 40; ++block) {
                const int frames = 37 + static_cast<int>(block) * 13;
                auto output = Noise<Sample>(static_cast<std::size_t>(frames * channels), 1.0, block + 1);
                auto expected = output;
                ProcessBlock(chorus, output.data(), frames, format);
                plain.Run(expected.data(), frames);
                for (std::size_t i = 0; i < output.size(); ++i)
                    ASSERT_NEAR(output[i], expected[i], tolerance)
                        << "settings " << step << ", block " << block << ", sample " << i << " of "
                        << channels;
            }
        }
    };
    for (const int channels : {1, 2}) {
        check(0.0, channels, 1e-9);
        check(0.0f, channels, 3e-7);
    }
}

TEST(Chorus, ForgetsWhenToldAndKeepsTheRingThroughPreparation) {
    for (const bool cleanup : {false, true}) {
        Chorus chorus;
        Load(chorus, Both(0, 10, 0, -960, 0));
        std::vector<double> impulse(40);
        impulse[39] = 1.0;
        Render(chorus, impulse, Format<double>(1), {40});
        if (cleanup) chorus.Cleanup();
        const auto output = Render(chorus, std::vector<double>(200), Format<double>(1), {40});
        EXPECT_EQ(std::ranges::count(output, 1.0), cleanup ? 0 : 1);
    }
}

// Catches a ring without room for the index that a shorter one leaves at its end.
TEST(Chorus, DelaysByTenSecondsAtMost) {
    Chorus chorus;
    Load(chorus, Both(0, INT_MAX, 0, -960, 0));
    std::vector<double> samples(480010);
    samples[0] = 1.0;
    samples = Render(chorus, samples, Format<double>(1), {4096});
    EXPECT_EQ(std::ranges::find(samples, 1.0) - samples.begin(), 480000);
}

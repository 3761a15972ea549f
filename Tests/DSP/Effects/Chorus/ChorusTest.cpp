#include "DSP/Effects/Chorus/Chorus.h"

#include <gtest/gtest.h>

#include <climits>
#include <cmath>

#include "Plain/PlainChorus.h"
#include "Support/EffectRun.h"

using Corvo::DSP::Chorus;
using TestSupport::Format;
using TestSupport::ProcessBlock;
using TestSupport::Render;

namespace {

// The words in their stored order: frequency, delay, wet, dry, depth.
std::vector<std::uint8_t> MakeChunk(const Plain::Chorus::Settings& s) {
    std::vector<std::uint8_t> chunk(4);
    for (const auto& pair : {s.frequency, s.delay, s.wet, s.dry, s.depth})
        for (const int word : pair)
            for (int shift = 0; shift < 32; shift += 8)
                chunk.push_back(static_cast<std::uint8_t>(static_cast<std::uint32_t>(word) >> shift));
    chunk.resize(92);
    return chunk;
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
            chorus.SetSettingsChunk(MakeChunk(steps[step]));
            const bool afresh = step == 3;
            if (afresh) chorus.InitProcessing(512, &format);
            plain.Cook(steps[step], 48000, channels, afresh);
            for (std::uint64_t block = 0; block < 40; ++block) {
                const int frames = 37 + static_cast<int>(block) * 13;
                auto output =
                    TestSupport::Noise<Sample>(static_cast<std::size_t>(frames * channels), 1.0, block + 1);
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

// Every extreme of every setting, in range and from a chunk; the sanitizer watches the ring.
TEST(Chorus, StaysInsideItsRing) {
    const auto extremes = {INT_MIN, -1, 0, 1, 3, 999, 1000, 10000, 1000000, INT_MAX};
    for (const int rate : {7919, 768000})
        for (const int channels : {1, 2}) {
            const auto format = Format<float>(channels, rate);
            Chorus chorus;
            chorus.InitProcessing(64, &format);
            const auto input = TestSupport::Noise<float>(static_cast<std::size_t>(70 * channels));
            for (const int delay : extremes)
                for (const int depth : extremes)
                    for (const int frequency : {0, 300, 2000000, INT_MIN}) {
                        chorus.SetSettingsChunk(
                            MakeChunk({{frequency, 7}, {delay, 30}, {0, 0}, {0, 0}, {depth, 1000}}));
                        for (int block = 0; block < 3; ++block) {
                            auto output = input;
                            ProcessBlock(chorus, output.data(), 70, format);
                            for (const float sample : output) ASSERT_LE(std::abs(sample), 0.5f);
                        }
                    }
        }
}

// Catches a ring without room for the index that a shorter one leaves at its end.
TEST(Chorus, DelaysByTenSecondsAtMost) {
    Chorus chorus;
    chorus.SetSettingsChunk(MakeChunk(Both(0, INT_MAX, 0, -960, 0)));
    std::vector<double> samples(480010);
    samples[0] = 1.0;
    samples = Render(chorus, samples, Format<double>(1), {4096});
    EXPECT_EQ(std::ranges::find(samples, 1.0) - samples.begin(), 480000);
}

TEST(Chorus, ForgetsWithCleanupAndKeepsTheRingThroughPreparation) {
    const auto format = Format<double>(1);
    const auto impulse = [&](Chorus& chorus) {
        chorus.SetSettingsChunk(MakeChunk(Both(0, 10, 0, -960, 0)));
        std::vector<double> block(40);
        block[39] = 1.0;
        Render(chorus, block, format, {40});
    };
    const auto sum = [&](Chorus& chorus) {
        double total = 0.0;
        for (const double sample : Render(chorus, std::vector<double>(200), format, {40})) total += sample;
        return total;
    };
    Chorus kept, cleaned, cleared;
    for (auto* chorus : {&kept, &cleaned, &cleared}) impulse(*chorus);
    cleaned.Cleanup();
    cleared.InitResetProcessingLight(false);
    EXPECT_EQ(sum(kept), 1.0);
    EXPECT_EQ(sum(cleaned), 0.0);
    EXPECT_EQ(sum(cleared), 0.0);
}

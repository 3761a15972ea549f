#include "DSP/Effects/Chorus/Chorus.h"

#include <gtest/gtest.h>

#include <climits>
#include <cmath>
#include <numbers>

#include "Plain/PlainChorus.h"
#include "Support/EffectRun.h"

using Corvo::DSP::Chorus;
using TestSupport::Format;
using TestSupport::ProcessBlock;
using TestSupport::Render;

namespace {

enum { kDelay, kFrequency = 2, kDepth = 4, kWet = 6, kDry = 8 };

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

// The delay in frames at every frame, read off a ramp.
std::vector<double> DelaysOf(const Plain::Chorus::Settings& settings, std::size_t frames) {
    Chorus chorus;
    chorus.SetSettingsChunk(MakeChunk(settings));
    std::vector<double> ramp(frames);
    for (std::size_t i = 0; i < frames; ++i) ramp[i] = static_cast<double>(i);
    auto delays = Render(chorus, ramp, Format<double>(1), {256});
    for (std::size_t i = 0; i < frames; ++i) delays[i] = ramp[i] - delays[i];
    return delays;
}

}  // namespace

// Catches a wrong wrap, a ring that loses its contents or its place when an edit makes it longer or shorter,
// and channels that read each other's samples.
TEST(Chorus, MatchesThePlainFormThroughEditsOfTheRing) {
    const Plain::Chorus::Settings steps[] = {
        Both(80, 400, -44, -60, 30),
        {{39, 23}, {20, 30}, {-30, -30}, {-30, -30}, {1000, 1000}},
        {{300, 200}, {3750, 40}, {0, -10}, {-960, 20}, {712, 0}},
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
            plain.Cook(steps[step], 48000, channels, false);
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

// Against the closed form, for a sweep at the end of the delay and for one over all of it.
TEST(Chorus, TracksTheSineWithinASample) {
    struct Case {
        int frequency, delay, depth;
        double longest, shortest;  // frames
    } const cases[] = {
        {80, 400, 30, 1863, 1806},  // 1920 frames, 57 of them swept, in the 56 that are even
        {300, 70, 1000, 336, 0},    // the whole ring
        {200, 100, 0, 480, 480},
    };
    for (const auto& c : cases) {
        const auto delays = DelaysOf(Both(c.frequency, c.delay, 0, -960, c.depth), 40000);
        const double middle = (c.longest + c.shortest) / 2, swing = (c.longest - c.shortest) / 2;
        for (std::size_t i = 2000; i < delays.size(); ++i) {
            const double angle =
                2 * std::numbers::pi * c.frequency / 100.0 * static_cast<double>(i + 1) / 48000;
            const double expected = middle - swing * std::sin(angle);
            // Where the sweep comes within a frame of the write position, old and new samples meet.
            if (c.depth == 1000 && (expected < 1.0 || expected > c.longest - 1.0)) continue;
            ASSERT_NEAR(delays[i], expected, 1.0) << c.delay << ", frame " << i;
        }
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

TEST(Chorus, MixesWetAndDryByTheirLevels) {
    const auto input = TestSupport::Noise<double>(2 * 3000);
    Chorus off;
    off.SetPreset(10);
    EXPECT_EQ(Render(off, input, Format<double>(), {512}), input) << "wet silent, dry at 0 dB";

    Chorus fixed;  // 10 ms, no sweep, 6 dB down on the left, silent on the right
    fixed.SetSettingsChunk(MakeChunk({{90, 90}, {100, 100}, {-60, -960}, {-960, -960}, {0, 0}}));
    const auto output = Render(fixed, input, Format<double>(), {512});
    const double gain = std::pow(10.0, -0.3);
    for (std::size_t i = 0; i < 3000; ++i) {
        const double delayed = i < 480 ? 0.0 : static_cast<float>(input[2 * (i - 480)]) * gain;
        ASSERT_NEAR(output[2 * i], delayed, 1e-15) << i;
        ASSERT_EQ(output[2 * i + 1], 0.0);
    }
}

// The tail lasts as long as the shortest delay, counted over the channels.
TEST(Chorus, RingsOutOnePassOfItsLine) {
    Chorus chorus;
    chorus.SetSettingsChunk(MakeChunk({{90, 90}, {200, 100}, {0, 0}, {0, 0}, {0, 500}}));
    const auto format = Format<float>();
    chorus.InitProcessing(64, &format);
    auto block = TestSupport::Noise<float>(2 * 64);
    ProcessBlock(chorus, block.data(), 64, format);
    chorus.StartTail(LLONG_MAX);
    int produced = 0;
    for (int blocks = 0; !chorus.TailFinished(); ++blocks) {
        ASSERT_LT(blocks, 100);
        ProcessBlock(chorus, block.data(), 64, format);
        produced += chorus.TailFramesProduced();
    }
    EXPECT_EQ(produced, 960 / 2);
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

TEST(Chorus, ShowsItsValues) {
    struct Case {
        int index;
        double value;
        const wchar_t* text;
    } const cases[] = {
        {kDelay, 0.04, L"40.0 ms"},      {kFrequency, 0.27, L"0.81 Hz"}, {kDepth + 1, 0.718, L"71.8 %"},
        {kWet, 0.0, L"-Inf. dB"},        {kWet, 1.0, L"10.0 dB"},        {kDry + 1, 0.8986, L"-0.7 dB"},
        {kDelay + 1, 1.0, L"1000.0 ms"},
    };
    Chorus chorus;
    for (const auto& c : cases)
        EXPECT_EQ(chorus.GetParameterFormattedText(c.index, c.value), c.text) << c.index << " at " << c.value;
    GenericUIData data;
    chorus.InitializeXyEditingData(data);
    EXPECT_EQ(data.entries, (std::vector<std::string>{"Default", "Choruses", "Flangers"}));
    EXPECT_EQ(data.groups[2].index, 2);
    EXPECT_EQ(data.groups[2].y_axis, (std::vector{kFrequency, kFrequency + 1}));
}

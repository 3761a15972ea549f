#include <gtest/gtest.h>

#include <algorithm>
#include <numbers>
#include <numeric>
#include <string>

#include "Apps/Program.h"
#include "Support/Signals.h"

namespace AppTest {
namespace {

class ConvertCommand : public Program {};

Sound Tone(std::size_t frames, int rate, int channels) {
    return {channels, rate, kDouble, TestSupport::Sine<double>(frames, 1000.0, rate, 0.5, channels)};
}

// Catches latency left in, a tail cut off, a wrong rate in the header and frames lost between blocks.
TEST_F(ConvertCommand, PutsEverySampleWhereItBelongs) {
    struct Case {
        int in, out, channels, raised;
        std::size_t frames, expected;
        const char* option;
    };
    const Case cases[] = {
        {44100, 48000, 2, 7056000, 30000, 32653, "--exact"},
        {48000, 44100, 1, 7056000, 30000, 27563, "--exact"},
        {48000, 96000, 48, 96000, 9000, 18000, "-q"},
        {96000, 48000, 3, 96000, 9001, 4501, "-q"},
        {44100, 44100, 2, 44100, 100, 100, "-q"},
        {48000, 8000, 1, 48000, 1, 0, "-q"},
    };
    for (const auto& c : cases) {
        const std::string rate = std::to_string(c.out);
        SCOPED_TRACE(std::to_string(c.in) + " to " + rate);
        Save("in.wav", Tone(c.frames, c.in, c.channels));
        Succeed("convert in.wav out.wav -y --rate " + rate + " " + c.option);
        if (c.expected == 0) continue;
        const Sound out = Load("out.wav"), exact = Tone(c.expected, c.out, c.channels);
        EXPECT_EQ(out.rate, c.out);
        EXPECT_EQ(out.channels, c.channels);
        ASSERT_EQ(out.Frames(), c.expected);
        // The ends ring; between them the filter's images, 65 dB down, and half a step of the raised rate.
        const double tolerance = 1e-3 + 0.5 * std::numbers::pi * 1000.0 / c.raised;
        const auto edge = static_cast<std::size_t>(c.channels) * std::min<std::size_t>(50, c.expected / 3);
        for (std::size_t i = edge; i + edge < out.samples.size(); ++i)
            ASSERT_NEAR(out.samples[i], exact.samples[i], tolerance) << i;
    }
}

TEST_F(ConvertCommand, WarnsOfARatioItMisses) {
    Save("in.wav", Tone(1000, 44100, 1));
    const auto near = Run("convert in.wav out.wav --rate 48000");
    EXPECT_EQ(near.status, 0);
    // 1200 log2(48000 / 44100 * 34 / 37)
    EXPECT_NE(near.err.find("37/34 is 0.32 cents sharp"), std::string::npos) << near.err;
    EXPECT_NE(near.err.find("--exact converts by 160/147"), std::string::npos) << near.err;
    EXPECT_EQ(Load("out.wav").Frames(), 1088u);
}

// Undithered, a constant of 1.6 steps is one step for ever; dithered it moves around it.
TEST_F(ConvertCommand, Dithers) {
    Save("in.wav", {1, 48000, kDouble, std::vector<double>(40000, 1.6 / 32768)});
    for (const std::string dither : {"none", "tpdf", "shaped", "shaped-strong"}) {
        Succeed("convert in.wav out.wav -y --rate 48000 --format s16 --dither " + dither);
        const auto samples = Load("out.wav").samples;
        const double mean = std::accumulate(samples.begin(), samples.end(), 0.0) * 32768 / 40000;
        EXPECT_GE(mean, 1.0) << dither;
        EXPECT_EQ(std::ranges::count(samples, samples[0]) == 40000, dither == "none") << dither;
    }
}

}  // namespace
}  // namespace AppTest

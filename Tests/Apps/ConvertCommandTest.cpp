#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <numbers>
#include <set>
#include <string>

#include "Apps/Program.h"

namespace AppTest {
namespace {

constexpr int kDouble = SF_FORMAT_WAV | SF_FORMAT_DOUBLE;

class ConvertCommand : public Program {};

// A sine of 1 kHz, the same on every channel.
Sound Tone(std::size_t frames, int rate, int channels, int format = kDouble) {
    Sound sound{channels, rate, format, {}};
    for (std::size_t i = 0; i < frames; ++i)
        sound.samples.insert(sound.samples.end(), static_cast<std::size_t>(channels),
                             0.5 * std::sin(2.0 * std::numbers::pi * 1000.0 * static_cast<double>(i) / rate));
    return sound;
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
        SCOPED_TRACE(std::to_string(c.in) + " to " + std::to_string(c.out));
        Save("in.wav", Tone(c.frames, c.in, c.channels));
        const auto result =
            Run({"convert", "in.wav", "out.wav", "-y", "--rate", std::to_string(c.out), c.option});
        ASSERT_EQ(result.status, 0) << result.err;
        EXPECT_EQ(result.err, "");
        if (c.expected == 0) continue;
        const Sound out = Load("out.wav"), exact = Tone(c.expected, c.out, c.channels);
        EXPECT_EQ(out.rate, c.out);
        EXPECT_EQ(out.channels, c.channels);
        ASSERT_EQ(out.Frames(), c.expected);
        // The ends ring; between them the filter's images, 65 dB down, and half a step of the raised rate.
        const double tolerance = 1e-3 + 0.5 * std::numbers::pi * 1000.0 / c.raised;
        const auto edge = static_cast<std::size_t>(c.channels) * std::min<std::size_t>(50, c.expected / 3);
        double largest = 0.0;
        for (std::size_t i = edge; i + edge < out.samples.size(); ++i)
            largest = std::max(largest, std::abs(out.samples[i] - exact.samples[i]));
        EXPECT_LT(largest, tolerance);
    }
}

TEST_F(ConvertCommand, WarnsOfRatiosItMissesAndRefusesFarOnes) {
    Save("in.wav", Tone(1000, 44100, 1));
    const auto near = Run({"convert", "in.wav", "out.wav", "--rate", "48000"});
    EXPECT_EQ(near.status, 0);
    // 1200 log2(48000 / 44100 * 34 / 37)
    EXPECT_NE(near.err.find("37/34 is 0.32 cents sharp"), std::string::npos) << near.err;
    EXPECT_NE(near.err.find("--exact converts by 160/147"), std::string::npos) << near.err;
    EXPECT_EQ(Load("out.wav").Frames(), 1088u);
    ExpectRefused(Run({"convert", "in.wav", "far.wav", "--rate", "1001", "--format", "s16"}), 2, {});
    ExpectRefused(Run({"convert", "in.wav", "far.wav", "--rate", "768000", "--dither", "loud"}), 2,
                  {"loud", "shaped-strong"});
    ExpectRefused(Run({"convert", "in.wav", "far.wav", "--rate", "44100", "--dither", "tpdf"}), 2,
                  {"s16 and s24"});
    ExpectRefused(Run({"convert", "in.wav", "far.wav", "--rate", "999"}), 2, {"999", "1000 to 768000"});
    Save("wide.wav", Tone(10, 44100, 49));
    ExpectRefused(Run({"convert", "wide.wav", "far.wav", "--rate", "48000"}), 2, {"49 channels", "48"});
}

// Undithered, a constant of 1.6 steps is one step for ever; dithered it moves around it.
TEST_F(ConvertCommand, Dithers) {
    Sound quiet{1, 48000, kDouble, std::vector<double>(40000, 1.6 / 32768)};
    Save("in.wav", quiet);
    for (const std::string dither : {"none", "tpdf", "shaped", "shaped-strong"}) {
        ASSERT_EQ(Run({"convert", "in.wav", "out.wav", "-y", "--rate", "48000", "--format", "s16", "--dither",
                       dither})
                      .status,
                  0);
        double sum = 0.0;
        std::set<double> values;
        for (const double sample : Load("out.wav").samples) {
            sum += sample * 32768 / 40000;
            values.insert(sample);
        }
        if (dither == "none") {
            EXPECT_EQ(values, std::set<double>{1.0 / 32768});
        } else {
            EXPECT_GE(values.size(), 3u) << dither;
            EXPECT_GT(sum, 1.0) << dither;
        }
    }
}

TEST_F(ConvertCommand, CountsWhatItClips) {
    Save("in.wav", Sound{1, 48000, kDouble, {0.0, 1.5, -1.5, -1.0, 0.5}});
    const auto result = Run({"convert", "in.wav", "out.wav", "--rate", "48000", "--format", "s24"});
    EXPECT_EQ(result.status, 0);
    EXPECT_NE(result.err.find("2 samples were clipped"), std::string::npos) << result.err;
    EXPECT_EQ(Load("out.wav").samples, (std::vector<double>{0.0, 8388607.0 / 8388608, -1.0, -1.0, 0.5}));
}

}  // namespace
}  // namespace AppTest

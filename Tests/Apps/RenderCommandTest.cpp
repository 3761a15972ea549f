#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <vector>

#include "Apps/Program.h"

namespace AppTest {
namespace {

class RenderCommand : public Program {};

struct MixCase {
    const char* fault;
    std::string fx;
    double leftFromLeft, leftFromRight, rightFromLeft, rightFromRight;
};

// What each setting must do to a stereo stream, as a mixing matrix.
TEST_F(RenderCommand, SetsParametersByLabelAndText) {
    const double half = std::pow(10.0, -6.0 / 20.0), makeUp = std::pow(10.0, 3.0 / 20.0);
    const MixCase cases[] = {
        {"the effect alone is not neutral", "Gain", 1, 0, 0, 1},
        {"number and unit", "Gain: Gain=-6 dB", half, 0, 0, half},
        {"case, blanks, no unit", "gain:  gAIN = -6 ", half, 0, 0, half},
        {"text without a number", "Gain: Gain=-Inf. dB", 1e-4, 0, 0, 1e-4},
        {"normalised value", "Gain: Pan=n:1", 0, 0, 0, makeUp},
        {"one side", "Gain: Flip phase L=On", -1, 0, 0, 1},
        {"both sides", "Gain: Flip phase=on", -1, 0, 0, -1},
        {"later settings win", "Gain: Flip phase=On, Flip phase R=Off", -1, 0, 0, 1},
        {"two settings", "Gain: Stereo width=0, Gain=-6 dB", half, half, half, half},
    };
    const Sound in = NoiseSound(100, 2, SF_FORMAT_WAV | SF_FORMAT_DOUBLE);
    Save("in.wav", in);
    for (const auto& c : cases) {
        SCOPED_TRACE(c.fault);
        const auto result = Run({"render", "in.wav", "out.wav", "-y", "--fx", c.fx});
        ASSERT_EQ(result.status, 0) << result.err;
        EXPECT_EQ(result.err, "");
        const Sound out = Load("out.wav");
        ASSERT_EQ(out.Frames(), in.Frames());
        for (std::size_t i = 0; i < in.samples.size(); i += 2) {
            const double l = in.samples[i], r = in.samples[i + 1];
            ASSERT_NEAR(out.samples[i], c.leftFromLeft * l + c.leftFromRight * r, 1e-6);
            ASSERT_NEAR(out.samples[i + 1], c.rightFromLeft * l + c.rightFromRight * r, 1e-6);
        }
    }
}

// Each effect gets the next --fx, in order, and IN and OUT may follow them.
TEST_F(RenderCommand, RunsAChainInOrder) {
    Sound in = NoiseSound(10, 1, SF_FORMAT_WAV | SF_FORMAT_DOUBLE);
    Save("in.wav", in);
    const auto result =
        Run({"render", "--fx", "Gain: Gain=-6 dB", "--fx", "Gain: Flip phase L=On", "in.wav", "out.wav"});
    ASSERT_EQ(result.status, 0) << result.err;
    const Sound out = Load("out.wav");
    for (std::size_t i = 0; i < in.samples.size(); ++i)
        ASSERT_NEAR(out.samples[i], -in.samples[i] * std::pow(10.0, -0.3), 1e-6);
}

TEST_F(RenderCommand, GivesTheSameBytesForEveryBlockAndLayout) {
    Save("in.wav", NoiseSound(5000));
    const std::vector<std::string> command{"render", "in.wav", "out.wav",
                                           "-y",     "--fx",   "Gain: Pan=0.3, Gain=-1"};
    ASSERT_EQ(Run(command).status, 0);
    const std::string expected = Bytes("out.wav");
    for (const std::vector<std::string>& extra : {std::vector<std::string>{"--block", "1"},
                                                  {"--block", "7"},
                                                  {"--block", "4096"},
                                                  {"--planar"},
                                                  {"--precision", "32"},
                                                  {"--precision", "32", "--planar", "--block", "64"}}) {
        auto varied = command;
        varied.insert(varied.end(), extra.begin(), extra.end());
        ASSERT_EQ(Run(varied).status, 0);
        EXPECT_EQ(Bytes("out.wav"), expected) << extra.back();
    }
}

TEST_F(RenderCommand, SavesAndLoadsTheState) {
    const Sound in = NoiseSound(50, 2, SF_FORMAT_WAV | SF_FORMAT_FLOAT);
    Save("in.wav", in);
    ASSERT_EQ(
        Run({"render", "in.wav", "a.wav", "--fx", "Gain: Gain=-3.5 dB, Pan=-0.5", "--save-chunk", "state"})
            .status,
        0);
    EXPECT_EQ(Bytes("state").size(), 20u);
    ASSERT_EQ(Run({"render", "in.wav", "b.wav", "--fx", "Gain: chunk=state"}).status, 0);
    EXPECT_EQ(Bytes("a.wav"), Bytes("b.wav"));
    // A setting beside the chunk changes it, wherever it stands.
    ASSERT_EQ(Run({"render", "in.wav", "c.wav", "--fx", "Gain: Pan=0, Gain=n:0.5, chunk=state"}).status, 0);
    EXPECT_EQ(Load("c.wav").samples, in.samples);

    SaveBytes("short", Bytes("state").substr(0, 19));
    ExpectRefused(Run({"render", "in.wav", "d.wav", "--fx", "Gain: chunk=short"}), 2,
                  {"short", "19 bytes", "20"});
    ExpectRefused(Run({"render", "in.wav", "d.wav", "--fx", "Gain", "--save-chunk", "state"}), 2,
                  {"state", "-y"});
}

TEST_F(RenderCommand, AddsATailOfSilenceWhenAskedAndTrimsAnAutomaticOne) {
    Save("in.wav", NoiseSound(1000, 1));
    ASSERT_EQ(Run({"render", "in.wav", "a.wav", "--fx", "Gain", "--tail", "0.5"}).status, 0);
    EXPECT_EQ(Load("a.wav").Frames(), 25000u);
    ASSERT_EQ(Run({"render", "in.wav", "b.wav", "--fx", "Gain", "--tail", "auto"}).status, 0);
    EXPECT_EQ(Load("b.wav").Frames(), 1000u);
}

// Lists by their texts, values as the effect shows them, and a tail that outlives the silence before an echo.
TEST_F(RenderCommand, LetsALateEchoRingOut) {
    Sound in{1, 48000, SF_FORMAT_WAV | SF_FORMAT_DOUBLE, std::vector<double>(1000)};
    in.samples[999] = 0.5;
    Save("in.wav", in);
    const std::string fx =
        "Echo: preset=single, Depth mode=time (linear), Depth=5000 ms, Delay=0, Mix=100 %, Out gain=0 dB";
    const auto result = Run({"render", "in.wav", "out.wav", "--tail", "auto", "--fx", fx});
    ASSERT_EQ(result.status, 0) << result.err;
    const auto out = Load("out.wav").samples;
    EXPECT_NEAR(static_cast<double>(out.size()), 1000 + 5 * 48000, 1);
    EXPECT_NEAR(out.back(), 0.25, 1e-6);
    ExpectRefused(Run({"render", "in.wav", "x.wav", "--fx", "Echo: Depth=5 apples"}), 2,
                  {"5 apples", "4999 ms"});
    ExpectRefused(Run({"render", "in.wav", "x.wav", "--fx", "Echo: Depth mode=slow"}), 2,
                  {"slow", "Time (log)"});
    ExpectRefused(Run({"render", "in.wav", "x.wav", "--fx", "Valvex: Oversampling=5"}), 2,
                  {"5", "1, 2, 4, 8"});
    ExpectRefused(Run({"render", "in.wav", "x.wav", "--fx", "Echo: preset=e, preset=s"}), 2, {"one preset"});
    ExpectRefused(Run({"render", "in.wav", "x.wav", "--fx", "Tremolo: preset=f00"}), 2,
                  {"f00", "Fast Tremolo"});
}

// A tremolo that stands still multiplies by 1 / (1 + depth); every step comes on its frame.
TEST_F(RenderCommand, PlaysAutomation) {
    Sound in{1, 48000, SF_FORMAT_WAV | SF_FORMAT_DOUBLE, std::vector<double>(1000, 0.5)};
    Save("in.wav", in);
    SaveBytes("moves.json", R"([{"parameter": "Depth", "points": [[0, 0], [0.01, 1], [0.015, 0.25]]}])");
    for (const std::string block : {"1", "64", "4096"}) {
        const auto result = Run({"render", "in.wav", "out.wav", "-y", "--fx", "Tremolo: Frequency=0",
                                 "--automation", "moves.json", "--block", block});
        ASSERT_EQ(result.status, 0) << result.err;
        const auto out = Load("out.wav").samples;
        for (std::size_t i = 0; i < out.size(); ++i)
            ASSERT_DOUBLE_EQ(out[i], 0.5 / (i < 480 ? 1.0 : i < 720 ? 2.0 : 1.25)) << i;
    }
}

TEST_F(RenderCommand, WarnsOfSettingsBeyondTheRange) {
    Save("in.wav", NoiseSound(10, 2, SF_FORMAT_WAV | SF_FORMAT_FLOAT));
    const auto result = Run({"render", "in.wav", "out.wav", "--fx", "Gain: Gain=40 dB"});
    EXPECT_EQ(result.status, 0);
    EXPECT_NE(result.err.find("Gain=40 dB is beyond the range; 20.0 dB is used"), std::string::npos)
        << result.err;
}

}  // namespace
}  // namespace AppTest

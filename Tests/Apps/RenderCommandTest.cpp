#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <string>
#include <utility>
#include <vector>

#include "Apps/Program.h"
#include "EffectParameters.h"
#include "Errors.h"

namespace AppTest {
namespace {

class RenderCommand : public Program {};

// What each setting must do to a stereo stream, as a mixing matrix; effects run in the order of their --fx.
TEST_F(RenderCommand, SetsParametersByLabelAndText) {
    const double half = std::pow(10.0, -6.0 / 20.0), makeUp = std::pow(10.0, 3.0 / 20.0);
    const struct {
        const char* fault;
        std::string fx;
        double leftFromLeft, leftFromRight, rightFromLeft, rightFromRight;
    } cases[] = {
        {"the effect alone is not neutral", "Gain", 1, 0, 0, 1},
        {"case, blanks, no unit", "gain:  gAIN = -6 ", half, 0, 0, half},
        {"text without a number", "Gain: Gain=-Inf. dB", 1e-4, 0, 0, 1e-4},
        {"far below all floors", "Gain: Gain=-1e400", 1e-4, 0, 0, 1e-4},
        {"next to nothing", "Gain: Gain=1e-400", 1, 0, 0, 1},
        {"normalised value", "Gain: Pan=n:1", 0, 0, 0, makeUp},
        {"one side", "Gain: Flip phase L=On", -1, 0, 0, 1},
        {"later settings win", "Gain: Flip phase=On, Flip phase R=Off", -1, 0, 0, 1},
        {"two settings", "Gain: Stereo width=0, Gain=-6 dB", half, half, half, half},
        {"order", "Gain: Pan=n:1\" --fx \"Gain: Stereo width=0", 0, makeUp, 0, makeUp},
    };
    const Sound in = NoiseSound(100, 2, kDouble);
    Save("in.wav", in);
    for (const auto& c : cases) {
        SCOPED_TRACE(c.fault);
        Succeed("render --fx \"" + c.fx + "\" in.wav out.wav -y");
        const Sound out = Load("out.wav");
        ASSERT_EQ(out.Frames(), in.Frames());
        for (std::size_t i = 0; i < in.samples.size(); i += 2) {
            const double l = in.samples[i], r = in.samples[i + 1];
            ASSERT_NEAR(out.samples[i], c.leftFromLeft * l + c.leftFromRight * r, 1e-6);
            ASSERT_NEAR(out.samples[i + 1], c.rightFromLeft * l + c.rightFromRight * r, 1e-6);
        }
    }
    for (const auto& [fx, warning] :
         {std::pair{"Gain: Gain=40 dB", "Gain=40 dB is beyond the range; 20.0 dB is used"},
          {"Gain: Gain=1e39", "Gain=1e39 is beyond the range; 20.0 dB is used"},
          {"Echo: Delay=-1e400", "Delay L=-1e400 is beyond the range; -30.0 dB is used"},
          {"Echo: Delay=-1e400", "Delay R=-1e400 is beyond the range; -30.0 dB is used"},
          {"Pitch Shift: Pitch=100", "Pitch=100 is beyond the range; 12.0 semitones"}}) {
        const auto beyond = Run(std::string("render in.wav out.wav -y --fx \"") + fx + "\"");
        EXPECT_EQ(beyond.status, 0);
        EXPECT_NE(beyond.err.find(warning), std::string::npos) << beyond.err;
    }
}

TEST_F(RenderCommand, GivesTheSameBytesForEveryBlockAndLayout) {
    Save("in.wav", NoiseSound(5000));
    const std::string command = "render in.wav out.wav -y --fx \"Gain: Pan=0.3, Gain=-1\" ";
    Succeed(command);
    const std::string expected = Bytes("out.wav");
    for (const std::string extra : {"--block 1", "--block 7", "--block 4096", "--planar", "--precision 32",
                                    "--precision 32 --planar --block 64"}) {
        Succeed(command + extra);
        EXPECT_EQ(Bytes("out.wav"), expected) << extra;
    }
}

TEST_F(RenderCommand, SavesAndLoadsTheState) {
    const Sound in = NoiseSound(50, 2, SF_FORMAT_WAV | SF_FORMAT_FLOAT);
    Save("in.wav", in);
    Succeed("render in.wav a.wav --fx \"Gain: Gain=-3.5 dB, Pan=-0.5\" --save-chunk state");
    EXPECT_EQ(Bytes("state").size(), 20u);
    Succeed("render in.wav b.wav --fx \"Gain: chunk=state\"");
    EXPECT_EQ(Bytes("a.wav"), Bytes("b.wav"));
    // A setting beside the chunk changes it, wherever it stands.
    Succeed("render in.wav c.wav --fx \"Gain: Pan=0, Gain=n:0.5, chunk=state\"");
    EXPECT_EQ(Load("c.wav").samples, in.samples);
}

// Presets go beyond what controls give, and older files of a compressor are shorter. What is refused is told
// from what changes nothing.
TEST(Chunks, AreTakenFromEveryPreset) {
    constexpr std::size_t kOlderCompressor = 16100;
    for (const auto& kind : dsphost::EffectKinds()) {
        SCOPED_TRACE(kind.name);
        const auto effect = kind.make(), other = kind.make();
        std::vector<std::uint8_t> chunk;
        for (int preset = -1; preset < effect->NumPresets(); ++preset) {
            effect->SetPreset(preset);
            effect->GetSettingsChunk(chunk);
            EXPECT_NO_THROW(dsphost::UseChunk(kind, *other, chunk, "file")) << preset;
        }
        EXPECT_THROW(dsphost::UseChunk(kind, *other, std::vector<std::uint8_t>(7), "file"),
                     dsphost::UserError);
        if (chunk.size() <= kOlderCompressor) continue;
        kind.make()->GetSettingsChunk(chunk);
        chunk.resize(kOlderCompressor);
        EXPECT_NO_THROW(dsphost::UseChunk(kind, *other, chunk, "file"));
    }
}

// A tremolo that stands still multiplies by 1 / (1 + depth); every step comes on its frame, whatever the
// order of the points, on both sides or on one.
TEST_F(RenderCommand, PlaysAutomation) {
    Save("in.wav", {2, 48000, kDouble, std::vector<double>(2000, 0.5)});
    SaveBytes("moves.json", R"([
        {"effect": 1, "parameter": "Depth", "points": [[0.01, 1], [0, 0], [0.015, 0.25]]},
        {"effect": 3, "parameter": "Depth R", "points": [{"time": 0, "value": 1}]}])");
    Succeed(
        "render in.wav out.wav --automation moves.json --fx \"Tremolo: Frequency=0\" --fx Gain "
        "--fx \"Tremolo: Frequency=0, Depth=0\"");
    const auto out = Load("out.wav").samples;
    ASSERT_EQ(out.size(), 2000u);
    for (std::size_t i = 0; i < 1000; ++i) {
        const double expected = 0.5 / (i < 480 ? 1.0 : i < 720 ? 2.0 : 1.25);
        ASSERT_NEAR(out[2 * i], expected, 1e-7) << i;
        ASSERT_NEAR(out[2 * i + 1], expected / 2.0, 1e-7) << i;
    }
}

// A neutral chain returns every sample of every kind of file, in the same sample format.
TEST_F(RenderCommand, KeepsTheInputsSamplesAndFormat) {
    for (const auto& [name, format] :
         std::vector<std::pair<std::string, int>>{{"a.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_U8},
                                                  {"c.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_24},
                                                  {"d.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_32},
                                                  {"e.wav", SF_FORMAT_WAV | SF_FORMAT_FLOAT},
                                                  {"g.flac", SF_FORMAT_FLAC | SF_FORMAT_PCM_S8},
                                                  {"h.flac", SF_FORMAT_FLAC | SF_FORMAT_PCM_16},
                                                  {"j.aiff", SF_FORMAT_AIFF | SF_FORMAT_PCM_24},
                                                  {"l.w64", SF_FORMAT_W64 | SF_FORMAT_PCM_16},
                                                  {"m.rf64", SF_FORMAT_RF64 | SF_FORMAT_PCM_24},
                                                  {"n.caf", SF_FORMAT_CAF | SF_FORMAT_PCM_16},
                                                  {"o.au", SF_FORMAT_AU | SF_FORMAT_PCM_16}}) {
        SCOPED_TRACE(name);
        // An odd number of odd-sized samples: chunks need their padding.
        Save("in-" + name, NoiseSound(333, 1, format));
        Succeed("render in-" + name + " out-" + name + " --fx Gain");
        const Sound in = Load("in-" + name), out = Load("out-" + name);
        EXPECT_EQ(out.samples, in.samples);
        EXPECT_EQ(out.rate, in.rate);
        constexpr int kMask = SF_FORMAT_TYPEMASK | SF_FORMAT_SUBMASK;
        EXPECT_EQ(out.format & kMask, in.format & kMask);
    }
    // The same samples give the same bytes: no time stamps.
    Succeed("render in-e.wav again.wav --fx Gain");
    EXPECT_EQ(Bytes("again.wav"), Bytes("out-e.wav"));
}

TEST_F(RenderCommand, RoundsToNearestEvenAndClips) {
    for (const auto& [format, most] : {std::pair{"s16", 32767.0}, {"s24", 8388607.0}}) {
        SCOPED_TRACE(format);
        const double step = 1.0 / (most + 1.0), full = most + 1.0;
        // In steps. Six are clipped, and one is no number.
        const double cases[] = {0.5,         1.5,      -0.5,      -2.5,        0.49,       0.51,
                                most,        -full,    full,      full - 0.51, full - 0.4, -full - 0.4,
                                -full - 0.6, 7 * full, -7 * full, std::nan("")};
        std::vector<double> samples;
        for (const double sample : cases) samples.push_back(sample * step);
        // The first seven alone, too: where nothing is clipped, a quicker way is taken.
        for (const std::size_t count : {std::size(cases), std::size_t{7}}) {
            samples.resize(count);
            Save("in.wav", {1, 1000, kDouble, samples});
            EXPECT_EQ(Run(std::string("render in.wav out.wav -y --format ") + format).err,
                      count == 7 ? ""
                                 : "dsphost: warning: in.wav: 1 sample is not a finite number, at 0.015 s\n"
                                   "dsphost: warning: out.wav: 6 samples were clipped\n");
            const Sound out = Load("out.wav");
            ASSERT_EQ(out.samples.size(), count);
            for (std::size_t i = 0; i < count; ++i) {
                const double nearest = std::isnan(cases[i]) ? 0.0 : std::nearbyint(cases[i]);
                EXPECT_EQ(out.samples[i], std::clamp(nearest, -full, most) * step) << cases[i];
            }
        }
    }
}

}  // namespace
}  // namespace AppTest

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <string>
#include <vector>

#include "Apps/Program.h"

namespace AppTest {
namespace {

class SampleFormats : public Program {};

struct Kept {
    const char* name;
    int format;
};

// A neutral chain returns every sample of every kind of file, in the same sample format.
TEST_F(SampleFormats, KeepTheInputsSamplesAndFormat) {
    const Kept cases[] = {
        {"a.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_U8},   {"b.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_16},
        {"c.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_24},   {"d.wav", SF_FORMAT_WAV | SF_FORMAT_PCM_32},
        {"e.wav", SF_FORMAT_WAV | SF_FORMAT_FLOAT},    {"f.wav", SF_FORMAT_WAV | SF_FORMAT_DOUBLE},
        {"g.flac", SF_FORMAT_FLAC | SF_FORMAT_PCM_S8}, {"h.flac", SF_FORMAT_FLAC | SF_FORMAT_PCM_16},
        {"i.flac", SF_FORMAT_FLAC | SF_FORMAT_PCM_24}, {"j.aiff", SF_FORMAT_AIFF | SF_FORMAT_PCM_24},
        {"k.aif", SF_FORMAT_AIFF | SF_FORMAT_FLOAT},   {"l.w64", SF_FORMAT_W64 | SF_FORMAT_PCM_16},
        {"m.rf64", SF_FORMAT_RF64 | SF_FORMAT_PCM_24}, {"n.caf", SF_FORMAT_CAF | SF_FORMAT_PCM_16},
        {"o.au", SF_FORMAT_AU | SF_FORMAT_PCM_16},
    };
    for (const auto& c : cases) {
        const std::string name = c.name;
        SCOPED_TRACE(name);
        // An odd number of odd-sized samples: chunks need their padding.
        Save("in-" + name, NoiseSound(333, 1, c.format));
        const auto result = Run({"render", "in-" + name, "out-" + name, "--fx", "Gain"});
        ASSERT_EQ(result.status, 0) << result.err;
        const Sound in = Load("in-" + name), out = Load("out-" + name);
        EXPECT_EQ(out.samples, in.samples);
        EXPECT_EQ(out.format & (SF_FORMAT_TYPEMASK | SF_FORMAT_SUBMASK),
                  in.format & (SF_FORMAT_TYPEMASK | SF_FORMAT_SUBMASK));
        EXPECT_EQ(out.rate, in.rate);
        // The outermost size counts everything behind it, padding too.
        const std::string bytes = Bytes("out-" + name);
        std::uint32_t size = 0;
        for (std::size_t i = 8; i-- > 4;) size = size << 8 | static_cast<unsigned char>(bytes[i]);
        if (bytes.substr(0, 4) == "RIFF") {
            EXPECT_EQ(size + 8, bytes.size());
        }
    }
    // The same samples give the same bytes: no time stamps.
    EXPECT_EQ(Run({"render", "in-e.wav", "again.wav", "--fx", "Gain"}).status, 0);
    EXPECT_EQ(Bytes("again.wav"), Bytes("out-e.wav"));
}

TEST_F(SampleFormats, RoundToNearestEvenAndClip) {
    const double step = 0x1p-15;
    Sound in{
        1,
        48000,
        SF_FORMAT_WAV | SF_FORMAT_DOUBLE,
        {0.5 * step, 1.5 * step, -0.5 * step, -2.5 * step, 0.49 * step, 0.51 * step, 1.0 - step, -1.0, 1.0,
         1.0 - 0.51 * step, 1.0 - 0.4 * step, -1.0 - 0.4 * step, -1.0 - 0.6 * step, 7.0, -7.0, std::nan("")}};
    const std::vector<double> expected{0,     2,     0,     -2,     0,      1,     32767,  -32768,
                                       32767, 32767, 32767, -32768, -32768, 32767, -32768, 0};
    Save("in.wav", in);
    const auto result = Run({"render", "in.wav", "out.wav", "--format", "s16"});
    ASSERT_EQ(result.status, 0);
    // 1.0, 1 - 0.4 steps, -1 - 0.6 steps, the two sevens, and what is no number.
    EXPECT_EQ(result.err, "dsphost: warning: out.wav: 6 samples were clipped\n");
    const Sound out = Load("out.wav");
    ASSERT_EQ(out.samples.size(), expected.size());
    for (std::size_t i = 0; i < expected.size(); ++i) EXPECT_EQ(out.samples[i], expected[i] * step) << i;

    // Floats go beyond full scale without harm.
    const auto loud = Run({"render", "in.wav", "loud.wav", "--format", "f32"});
    EXPECT_EQ(loud.err, "");
    EXPECT_EQ(Load("loud.wav").samples[13], 7.0);
}

TEST_F(SampleFormats, OfLossyInputAreFloats) {
    Save("in.ogg", NoiseSound(5000, 2, SF_FORMAT_OGG | SF_FORMAT_VORBIS));
    ASSERT_EQ(Run({"render", "in.ogg", "out.wav"}).status, 0);
    EXPECT_EQ(Load("out.wav").format, SF_FORMAT_WAV | SF_FORMAT_FLOAT);
    EXPECT_EQ(Load("out.wav").samples, Load("in.ogg").samples);
    ASSERT_EQ(Run({"render", "in.ogg", "out.flac"}).status, 0);
    EXPECT_EQ(Load("out.flac").format, SF_FORMAT_FLAC | SF_FORMAT_PCM_24);
    ASSERT_EQ(Run({"render", "out.wav", "again.ogg"}).status, 0);
    EXPECT_EQ(Load("again.ogg").Frames(), 5000u);
}

}  // namespace
}  // namespace AppTest

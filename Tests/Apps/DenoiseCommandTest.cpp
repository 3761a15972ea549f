#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>

#include "Apps/Program.h"
#include "Support/Signals.h"

namespace AppTest {
namespace {

class DenoiseCommand : public Program {};

// Noise alone for two seconds, then with a tone.
Sound Recording(int rate, int channels = 1) {
    Sound sound = NoiseSound(static_cast<std::size_t>(4 * rate), channels, kDouble);
    sound.rate = rate;
    for (std::size_t i = 0; i < sound.samples.size(); ++i) {
        const double t = static_cast<double>(i / static_cast<std::size_t>(channels)) / rate;
        sound.samples[i] = 0.05 * sound.samples[i] + (t > 2.0 ? 0.4 * std::sin(2764.6 * t) : 0.0);
    }
    return sound;
}

double Power(const Sound& sound, double from, double to) {
    return TestSupport::Level(sound.samples, from, to, sound.rate * sound.channels);
}

// Catches output that is late or short, a residue that is not what is missing, passages that are not heeded,
// and settings that are not applied over the profile's.
TEST_F(DenoiseCommand, LearnsAndCleansInOneCommand) {
    const Sound in = Recording(48000);
    Save("in.wav", in);
    Succeed("denoise in.wav out.wav --learn 0.2:1 --learn 0.9:1.8 --residue gone.wav --save-profile hiss -q");
    const Sound out = Load("out.wav"), gone = Load("gone.wav");
    ASSERT_EQ(out.Frames(), in.Frames());
    ASSERT_EQ(gone.Frames(), in.Frames());
    for (std::size_t i = 0; i < in.samples.size(); ++i)
        ASSERT_NEAR(out.samples[i] + gone.samples[i], in.samples[i], 1e-12) << "sample " << i;
    EXPECT_NEAR(Power(in, 0.3, 1.7) - Power(out, 0.3, 1.7), 25.0, 2.0);
    EXPECT_NEAR(Power(in, 2.5, 3.5), Power(out, 2.5, 3.5), 0.1);

    Save("other.wav", Recording(96000, 2));
    Succeed("denoise other.wav clean.wav --profile hiss --set \"Reduction=10 dB, FFT size=2048\" -q");
    const Sound other = Load("other.wav"), clean = Load("clean.wav");
    // At twice the rate the noise's density is half of what was learned, so all of it counts as noise.
    EXPECT_NEAR(Power(other, 0.3, 1.7) - Power(clean, 0.3, 1.7), 10.0, 1.0);
    EXPECT_NEAR(Power(other, 2.5, 3.5), Power(clean, 2.5, 3.5), 0.2);
    Succeed("denoise in.wav adaptive.wav -q");
    EXPECT_NEAR(Power(in, 0.5, 1.7) - Power(Load("adaptive.wav"), 0.5, 1.7), 25.0, 3.0);

    // The profile's line runs along the noise: white, so level.
    const auto table = Rows(Succeed("spectrum in.wav --csv - --profile hiss --length 1024 -q"),
                            "frequency_hz,level_db,profile_db");
    const auto row = std::ranges::find(table, "12000.0000", [](const auto& cells) { return cells[0]; });
    ASSERT_NE(row, table.end());
    EXPECT_NEAR(std::stod((*row)[1]), std::stod((*row)[2]), 1.5);
}

}  // namespace
}  // namespace AppTest

#include "DSP/Pitch/VoicePitchDetector.h"

#include <gtest/gtest.h>

#include <algorithm>

#include "Support/Voice.h"

using namespace Corvo::DSP;
using namespace TestSupport;

namespace {

std::vector<VoicePitchFrame> Hear(const std::vector<double>& samples, const VoicePitchSettings& settings) {
    constexpr std::size_t kBlock = 500;
    VoicePitchDetector detector(settings);
    std::vector<VoicePitchFrame> frames;
    for (std::size_t done = 0; done < samples.size(); done += kBlock) {
        detector.Push(samples.data() + done, static_cast<int>(std::min(samples.size() - done, kBlock)));
        for (VoicePitchFrame frame; detector.Take(frame);) frames.push_back(frame);
    }
    return frames;
}

double ShareVoiced(const std::vector<VoicePitchFrame>& frames) {
    const auto voiced = std::ranges::count_if(frames, [](const auto& frame) { return frame.hz > 0.0; });
    return static_cast<double>(voiced) / static_cast<double>(frames.size());
}

}  // namespace

// Catches lags, windows and filters that fit 48 kHz only, and octaves.
TEST(VoicePitchDetector, HearsAVoiceAtEveryRate) {
    constexpr double kCases[][3] = {{8000, 75, 110.3},   {8000, 75, 391.0},   {16000, 75, 220.9},
                                    {44100, 75, 82.0},   {44100, 75, 1303.0}, {48000, 38, 41.2},
                                    {48000, 160, 523.0}, {96000, 55, 61.7},   {192000, 75, 247.3}};
    for (const auto& [rate, lowest, hz] : kCases) {
        SCOPED_TRACE(std::to_string(rate) + " Hz, " + std::to_string(hz));
        const auto frames = Hear(Sing(0.5, static_cast<int>(rate), hz), {.rate = rate, .lowestHz = lowest});
        ASSERT_GT(frames.size(), 80u);
        // Rates whose samples are coarse against the period leave a fraction of a cent more.
        const double allowed = rate < 20000 ? 3.0 : 0.3;
        for (const auto& frame : frames)
            if (static_cast<double>(frame.end) > 0.1 * rate) {
                ASSERT_GT(frame.hz, 0.0) << frame.end;
                ASSERT_NEAR(Cents(frame.hz, hz), 0.0, allowed) << frame.end;
            }
    }
}

// A thin voice has no fundamental: it is a high-pass away. Catches a method that looks for the lowest
// partial.
TEST(VoicePitchDetector, HearsAVoiceWithoutFundamental) {
    std::vector<double> samples(24000, 0.0);
    for (int h = 4; h <= 20; ++h)
        samples = Mixed(samples, Sine<double>(samples.size(), 131.0 * h, 48000, 0.05));
    for (const auto& frame : Hear(samples, {}))
        if (frame.end > 4800) {
            ASSERT_NEAR(Cents(frame.hz, 131.0), 0.0, 5.0);
        }
}

TEST(VoicePitchDetector, TellsNoiseAndSilenceFromAVoice) {
    EXPECT_LT(ShareVoiced(Hear(Noise<double>(48000), {})), 0.02);
    EXPECT_EQ(ShareVoiced(Hear(std::vector<double>(48000), {})), 0.0);
    auto faint = Sing(0.5, 48000, 200.0);
    for (double& sample : faint) sample *= 1e-3;
    EXPECT_EQ(ShareVoiced(Hear(faint, {.silence = -60.0})), 0.0);
    EXPECT_GT(ShareVoiced(Hear(faint, {.silence = -90.0})), 0.9);
}

// Catches a time stamp that is off: in a glide the estimate would be, too.
TEST(VoicePitchDetector, SaysWhenTheEstimateFits) {
    const auto hz = [](double seconds) { return 150.0 * std::exp2(0.6 * seconds); };
    for (const auto& frame : Hear(Sing(1.5, 48000, hz), {}))
        if (frame.end > 9600) {
            const double seconds = (static_cast<double>(frame.end) - frame.age) / 48000.0;
            ASSERT_NEAR(Cents(frame.hz, hz(seconds)), 0.0, 2.0) << seconds;
            ASSERT_LT(frame.age, 0.0105 * 48000);
        }
}

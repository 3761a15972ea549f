#include <gtest/gtest.h>

#include "DenoiserRun.h"

using namespace TestSupport;

// What the noise reducer does to sound.
namespace {

constexpr const char* kSizes[]{"512 + 2048 + 8192", "512 + 4096", "2048", "1024"};
constexpr int kLatencies[]{9216, 5120, 2048, 1024};

// Catches a wrong latency or rate, windows that do not add up, a blend whose weights do not, a dry path that
// is not aligned with the wet one.
TEST(DenoiserSound, WithoutReductionIsTheDelayedInputAtEveryRateAndSize) {
    const struct {
        int rate, numerator, denominator;  // of the latency at 48 kHz
    } rates[] = {{8000, 1, 4}, {22050, 1, 2}, {44100, 1, 1}, {48000, 1, 1}, {96000, 2, 1}, {192000, 4, 1}};
    for (std::size_t size = 0; size < std::size(kSizes); ++size)
        for (const auto& [rate, numerator, denominator] : rates) {
            SCOPED_TRACE(std::string(kSizes[size]) + " at " + std::to_string(rate));
            const auto format = Format<double>(1, rate);
            const auto input = Noise<double>(static_cast<std::size_t>(rate));
            DenoiserProcessor denoiser, residue;
            SetText(denoiser, kSize, kSizes[size]);
            SetText(residue, kSize, kSizes[size]);
            SetText(residue, kListen, "Residue");
            const auto cleaned = Clean(denoiser, input, format);
            EXPECT_EQ(denoiser.GetLatency(), kLatencies[size] * numerator / denominator);
            EXPECT_EQ(denoiser.Format().latency, denoiser.GetLatency());
            const auto whole = Mixed(cleaned, Clean(residue, input, format));
            EXPECT_LT(Level(cleaned, 0.6, 1.0, rate), Level(input, 0.6, 1.0, rate) - 10.0)
                << "it does reduce";
            EXPECT_LT(Level(Mixed(whole, input, -1.0), 0, 1, rate), Level(input, 0, 1, rate) - 110.0);
            SetText(denoiser, kReduction, "0 dB");
            EXPECT_LT(Level(Mixed(Clean(denoiser, input, format), input, -1.0), 0, 1, rate),
                      Level(input, 0, 1, rate) - 110.0);
        }
}

// A decaying chord twice a second in noise 10 dB below it, after two seconds of noise alone: how many
// decibels nearer to the clean sound the output is than the input. Catches gains, smoothing, tracker or blend
// gone wrong; the bounds are what a textbook's method reaches or nearly.
TEST(DenoiserSound, ComesNearerToTheCleanSound) {
    constexpr int kSeconds = 7;
    const struct {
        const char *size, *what;
        float profile;
        int rate;
        double least;
    } cases[] = {
        {kSizes[0], "learned", kLearned, 48000, 10.0},    {kSizes[0], "44.1 kHz", kLearned, 44100, 10.0},
        {kSizes[0], "96 kHz", kLearned, 96000, 10.0},     {kSizes[0], "16 kHz", kLearned, 16000, 6.5},
        {kSizes[0], "following", kFollowing, 48000, 9.5}, {kSizes[0], "adaptive", kAdaptive, 48000, 9.0},
        {kSizes[1], "learned", kLearned, 48000, 9.0},     {kSizes[1], "adaptive", kAdaptive, 48000, 8.5},
        {kSizes[2], "learned", kLearned, 48000, 8.5},     {kSizes[2], "adaptive", kAdaptive, 48000, 8.0},
        {kSizes[3], "learned", kLearned, 48000, 7.0}};
    for (const auto& c : cases) {
        const auto format = Format<float>(1, c.rate);
        const auto rate = static_cast<std::size_t>(c.rate);
        std::vector<float> clean(kSeconds * rate);
        for (std::size_t i = 2 * rate; i < clean.size(); ++i)
            for (const double hz : {220.0, 277.2, 329.6, 1318.5, 2637.0}) {
                const double t = static_cast<double>(i) / c.rate, since = std::fmod(t, 0.5);
                clean[i] += static_cast<float>(0.1 * std::exp(-8.0 * since) *
                                               std::sin(2.0 * std::numbers::pi * hz * since));
            }
        const auto noise = Noise<float>(clean.size(), 1.0);
        const double gain =
            std::pow(10.0, (Level(clean, 2, 7, c.rate) - 10.0 - Level(noise, 2, 7, c.rate)) / 20.0);
        const auto noisy = Mixed(clean, noise, gain);
        DenoiserProcessor denoiser;
        Learn(denoiser,
              std::vector<float>(noisy.begin(), noisy.begin() + static_cast<std::ptrdiff_t>(2 * rate)),
              format);
        denoiser.SetParam(kProfile, c.profile, false);
        SetText(denoiser, kSize, c.size);
        if (c.profile == kAdaptive) denoiser.SetParam(kClear, 1.0f, false);
        const auto cleaned = Clean(denoiser, noisy, format);
        const double before = Level(Mixed(noisy, clean, -1.0), 2, 7, c.rate),
                     after = Level(Mixed(cleaned, clean, -1.0), 2, 7, c.rate);
        EXPECT_GT(before - after, c.least) << c.size << ", " << c.what;
        EXPECT_NEAR(Level(noisy, 1, 1.9, c.rate) - Level(cleaned, 1, 1.9, c.rate), 25.0, 3.0)
            << c.size << ", " << c.what << ": attenuation of the noise alone";
    }
}

// Catches a level that is not followed, lines that are taken for notes for ever, and a floor that is not
// where "Reduction" and the ranges put it. Levels are those of the output under that of the input, in
// decibels.
TEST(DenoiserSound, FollowsWhatChanges) {
    constexpr std::size_t kRate = 48000;
    const auto format = Format<float>(1);
    const auto noise = Noise<float>(12 * kRate, 0.02);
    auto louder = noise;
    for (std::size_t i = 4 * kRate; i < louder.size(); ++i) louder[i] *= 3.16f;
    auto hum = noise;
    for (const double hz : {50.0, 150.0, 250.0, 350.0}) hum = Mixed(hum, Sine<float>(hum.size(), hz), 0.05);
    using Texts = std::vector<std::pair<int, const char*>>;
    const auto all = [](int first, const char* text) {
        Texts texts;
        for (int i = 0; i < 8; ++i) texts.emplace_back(first + i, text);
        return texts;
    };
    const struct {
        const char* what;
        const std::vector<float>& input;
        float profile;
        double from, to, least, most;
        Texts texts{};
    } cases[] = {
        {"10 dB over the profile is no noise", louder, kLearned, 6, 8, -1, 3},
        {"the profile follows", louder, kFollowing, 6, 8, 20, 99},
        {"the profile adapts", louder, kAdaptive, 6, 8, 20, 99},
        {"from the first moment", noise, kAdaptive, 0, 0.05, 15, 99},
        {"might be a note", hum, kAdaptive, 0.5, 1, -1, 10},
        {"hums steadily", hum, kAdaptive, 6, 8, 20, 99},
        {"ranges", noise, kLearned, 3, 8, 5.5, 6.5, all(20, "6 dB")},
        {"mix", noise, kLearned, 3, 8, 4.8, 6.8, {{kMix, "50 %"}}},
        {"the profile is 12 dB lower than the noise", noise, kLearned, 3, 8, -1, 3, all(12, "-12 dB")},
    };
    for (const auto& c : cases) {
        DenoiserProcessor denoiser;
        Learn(denoiser, std::vector<float>(noise.begin(), noise.begin() + 2 * kRate), format);
        if (c.profile == kAdaptive) denoiser.SetParam(kClear, 1.0f, false);
        denoiser.SetParam(kProfile, c.profile, false);
        for (const auto& [index, text] : c.texts) SetText(denoiser, index, text);
        const auto cleaned = Clean(denoiser, c.input, format);
        const double reduced = Level(c.input, c.from, c.to) - Level(cleaned, c.from, c.to);
        EXPECT_TRUE(reduced > c.least && reduced < c.most) << c.what << ": " << reduced;
    }
}

// Catches gains that differ between the sides, and a profile that counts for both.
TEST(DenoiserSound, StereoHasAProfilePerSideAndOneGain) {
    const auto mono = Format<double>(1), stereo = Format<double>(2);
    const auto left = Noise<double>(96000), other = Noise<double>(96000, 0.02, 9);
    std::vector<double> same, different;
    for (std::size_t i = 0; i < left.size(); ++i) {
        same.insert(same.end(), {left[i], left[i]});
        different.insert(different.end(), {left[i], other[i]});
    }
    DenoiserProcessor one, two;
    const auto single = Clean(one, left, mono), both = Clean(two, same, stereo);
    EXPECT_EQ(Channel(both, 0), Channel(both, 1));
    EXPECT_LT(Level(Mixed(single, Channel(both, 0), -1.0), 0, 2), Level(single, 0, 2) - 100.0);
    Learn(two, different, stereo);
    two.SetParam(kProfile, kLearned, false);
    const auto cleaned = Clean(two, different, stereo);
    for (const std::size_t i : {0u, 1u})
        EXPECT_NEAR(Level(Channel(different, i), 0.5, 1.5) - Level(Channel(cleaned, i), 0.5, 1.5), 25.0, 2.0)
            << i;
}

// Catches drop-outs and clicks where the windows change while sound runs, or learning begins and ends.
TEST(DenoiserSound, ChangesWithoutAGap) {
    const auto format = Format<float>(1);
    const auto tone = Sine<float>(4 * 48000, 400.0);
    DenoiserProcessor denoiser;
    SetText(denoiser, kReduction, "6 dB");
    const auto output =
        Render(denoiser, tone, format, {512},
               {{60000, kSize, 1.0f}, {100000, kSize, 0.0f}, {140000, kLearn, 1.0f}, {150000, kLearn, 0.0f}});
    for (std::size_t at = 20000; at + 480 < output.size(); at += 480) {
        const double from = static_cast<double>(at) / 48000.0;
        ASSERT_NEAR(Level(output, from, from + 0.01), -9.03, 3.0) << "frame " << at;
    }
    for (std::size_t i = 20000; i < output.size(); ++i)
        ASSERT_LT(std::abs(output[i] - output[i - 1]), 0.06f) << "a click at frame " << i;
}

}  // namespace

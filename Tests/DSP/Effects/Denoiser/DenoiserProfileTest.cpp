#include <gtest/gtest.h>

#include <limits>

#include "DenoiserRun.h"
#include "Support/AudioThreadRules.h"

using namespace TestSupport;

// The learned noise: how it is learned, kept and handed over.
namespace {

constexpr std::size_t kParameters = 28, kSecondsAt = 12 + 8 * kParameters, kRateAt = kSecondsAt + 8,
                      kChannelsAt = kRateAt + 4, kSpectraAt = kChannelsAt + 4;

// White noise of a variance.
std::vector<float> White(double seconds, double variance, std::uint64_t seed = 1, int rate = 48000) {
    return Noise<float>(static_cast<std::size_t>(seconds * rate), std::sqrt(3.0 * variance), seed);
}

// The mean of the learned density between a tenth and nine tenths of the band, as a variance.
double Density(DenoiserProcessor& denoiser, double rate = 48000.0) {
    std::vector<float> density(2049);
    if (!denoiser.LearnedDensity(rate, density.data(), static_cast<int>(density.size()))) return 0.0;
    double sum = 0.0;
    for (std::size_t bin = 205; bin < 1844; ++bin)
        sum += static_cast<double>(density[bin]) / (1844.0 - 205.0);
    return sum;
}

// A chunk's profile alone.
Bytes ProfileOf(DenoiserProcessor& denoiser) {
    const auto chunk = Chunk(denoiser);
    return {chunk.begin() + kSecondsAt, chunk.end()};
}

// Catches passages that replace each other or count by number instead of length, a clear that leaves
// something, a profile that does not survive what it should.
TEST(DenoiserProfile, AddsPassagesUpUntilCleared) {
    const auto format = Format<float>(1);
    DenoiserProcessor denoiser;
    EXPECT_EQ(Density(denoiser), 0.0);
    Learn(denoiser, White(1.0, 0.01), format);
    EXPECT_NEAR(denoiser.LearnedSeconds(), 1.0, 1e-9);
    EXPECT_NEAR(Density(denoiser), 0.01, 0.0004);
    Learn(denoiser, White(3.0, 0.03, 2), format);
    EXPECT_NEAR(denoiser.LearnedSeconds(), 4.0, 1e-9);
    EXPECT_NEAR(Density(denoiser), 0.025, 0.0006);
    const double both = Density(denoiser);
    Learn(denoiser, White(0.005, 1.0), format);
    EXPECT_EQ(Density(denoiser), both) << "shorter than any window";
    Learn(denoiser, White(0.02, 0.025, 3), format);
    EXPECT_NEAR(Density(denoiser), both, 0.001) << "too short for the long windows";
    denoiser.SetPreset(1);
    denoiser.Cleanup();
    denoiser.InitProcessing(64, &format);
    EXPECT_NEAR(denoiser.LearnedSeconds(), 4.02, 1e-6);
    for (const bool whole : {true, false}) {
        const double before = denoiser.LearnedSeconds();
        denoiser.InitProcessing(48000, &format);
        Open(denoiser, White(1.0, 0.01), format);
        if (whole)
            denoiser.InitProcessing(64, &format);
        else
            denoiser.InitResetProcessingLight(true);
        Close(denoiser, format);
        EXPECT_NEAR(denoiser.LearnedSeconds(), before + 1.0, 1e-6) << "a start ends the passage";
    }
    denoiser.SetParam(kClear, 1.0f, false);
    EXPECT_EQ(denoiser.GetParam(kClear), 0.0f);
    EXPECT_EQ(denoiser.LearnedSeconds(), 0.0);
    Learn(denoiser, White(1.0, 0.002), format);
    EXPECT_NEAR(Density(denoiser), 0.002, 0.0001);
}

// Catches what was learned before a clear or a load, and arrives after it.
TEST(DenoiserProfile, WhatTheUserDidLastWins) {
    const auto format = Format<float>(1);
    const auto white = White(0.5, 0.01);
    DenoiserProcessor loaded, denoiser;
    Learn(loaded, White(0.5, 0.04), format);
    Learn(denoiser, white, format);  // on its way to the user's thread
    denoiser.SetParam(kClear, 1.0f, false);
    EXPECT_EQ(denoiser.LearnedSeconds(), 0.0);
    Learn(denoiser, white, format);
    denoiser.SetSettingsChunk(Chunk(loaded));
    EXPECT_NEAR(Density(denoiser), 0.04, 0.002);
    Clean(denoiser, std::vector<float>(64), format);
    EXPECT_NEAR(Density(denoiser), 0.04, 0.002);
    denoiser.InitProcessing(24000, &format);
    Open(denoiser, white, format);
    denoiser.SetSettingsChunk(Chunk(loaded));
    Close(denoiser, format);
    EXPECT_EQ(ProfileOf(denoiser), ProfileOf(loaded)) << "the open passage is no part of it";
    denoiser.InitProcessing(24000, &format);
    Open(denoiser, white, format);
    denoiser.SetParam(kClear, 1.0f, true);  // automation, on the audio thread
    Close(denoiser, format);
    EXPECT_EQ(denoiser.LearnedSeconds(), 0.0);
    denoiser.SetParam(kLearn, 1.0f, false);
    denoiser.SetSettingsChunk(Chunk(denoiser));
    EXPECT_EQ(denoiser.GetParam(kLearn), 0.0f) << "loading starts no passage";
}

// Catches allocations in learning and in handing over.
TEST(DenoiserProfile, LearningNeitherAllocatesNorLocks) {
    if (!AudioThreadRules::CanCount()) GTEST_SKIP() << "no counters on this build";
    const auto format = Format<float>(1);
    DenoiserProcessor denoiser, donor;
    Learn(donor, White(0.5, 0.01), format);
    const auto chunk = Chunk(donor);
    denoiser.InitProcessing(256, &format);
    auto block = White(256.0 / 48000.0, 0.01);
    for (int round = 0; round < 300; ++round) {
        if (round % 60 == 10) denoiser.SetParam(kLearn, 1.0f, false);
        if (round % 60 == 50) denoiser.SetParam(kLearn, 0.0f, false);
        if (round == 150) denoiser.SetSettingsChunk(chunk);
        if (round % 50 == 49) denoiser.SetParam(kClear, 1.0f, round > 100);
        ASSERT_EQ(BrokenBy([&] { ProcessBlock(denoiser, block.data(), 256, format); }), "") << round;
        if (round % 9 == 0) denoiser.LearnedSeconds();
    }
}

// Catches a profile that is lost, rounded or taken at the wrong frequency or level on its way through a
// chunk.
TEST(DenoiserProfile, TravelsInTheChunk) {
    const auto stereo = Format<float>(2), fast = Format<float>(2, 96000);
    DenoiserProcessor denoiser, other;
    Learn(denoiser, White(2.0, 0.01), stereo);
    const auto chunk = Chunk(denoiser);
    EXPECT_EQ(chunk.size(), kSpectraAt + 2 * (5 * 4 + 8 * (257 + 513 + 1025 + 2049 + 4097)));
    other.SetSettingsChunk(chunk);
    EXPECT_EQ(Chunk(other), chunk);
    // The same sound at twice the rate, as a resampler would make it, has its power in half the band.
    EXPECT_NEAR(Density(other, 96000.0), 0.02, 0.001);
    other.SetParam(kProfile, kLearned, false);
    const auto hiss = Noise<float>(4 * 96000, std::sqrt(3.0 * 0.02));
    const auto cleaned = Clean(other, hiss, fast);
    EXPECT_NEAR(Level(hiss, 0.5, 1.5, 192000) - Level(cleaned, 0.5, 1.5, 192000), 25.0, 2.0);
    for (const int rate : {8000, 48000}) {
        const auto elsewhere = Format<float>(2, rate);
        other.InitProcessing(64, &elsewhere);
    }
    EXPECT_EQ(ProfileOf(other), ProfileOf(denoiser)) << "using it elsewhere does not change it";
    denoiser.SetParam(kProfile, kLearned, false);
    const auto sound = White(1.0, 0.01, 3);
    EXPECT_EQ(Clean(other, sound, stereo), Clean(denoiser, sound, stereo)) << "nor what is used";
}

// Catches a mono recording cleaned with the left channel's noise alone.
TEST(DenoiserProfile, IsTheMeanOfItsChannelsInMono) {
    DenoiserProcessor denoiser;
    auto uneven = White(2.0, 0.039);
    for (std::size_t i = 0; i < uneven.size(); i += 2) uneven[i] *= 0.16f;
    Learn(denoiser, uneven, Format<float>(2));
    denoiser.SetParam(kProfile, kLearned, false);
    const auto hiss = White(2.0, 0.02, 2);
    const auto cleaned = Clean(denoiser, hiss, Format<float>(1));
    EXPECT_NEAR(Level(hiss, 0.5, 1.5) - Level(cleaned, 0.5, 1.5), 25.0, 2.0);
}

// Catches trust in a chunk's profile. A chunk that is refused changes neither settings nor profile.
TEST(DenoiserProfile, RefusesABrokenChunkWhole) {
    const auto format = Format<float>(1);
    DenoiserProcessor donor, denoiser;
    Learn(donor, White(0.5, 0.01), format);
    SetText(donor, kReduction, "40 dB");
    const auto good = Chunk(donor);
    Learn(denoiser, White(0.5, 0.02), format);
    const auto before = Chunk(denoiser);
    const auto refuse = [&](const Bytes& chunk, const std::string& fault) {
        denoiser.SetSettingsChunk(chunk);
        EXPECT_EQ(Chunk(denoiser), before) << fault;
    };
    for (std::size_t length = 0; length < good.size(); length += good.size() / 150)
        refuse(Bytes(good.begin(), good.begin() + static_cast<std::ptrdiff_t>(length)),
               "cut at " + std::to_string(length));
    const auto put = [&](std::size_t at, auto value, const char* fault) {
        auto chunk = good;
        Put(chunk, at, value);
        refuse(chunk, fault);
    };
    constexpr double kEndless = std::numeric_limits<double>::infinity();
    put(4, 2, "another version");
    put(8, -1, "no count of parameters");
    put(12, std::nan(""), "a parameter that is no number");
    put(kSecondsAt, -1.0, "negative seconds");
    put(kSecondsAt, kEndless, "endless seconds");
    put(kRateAt, 0, "no rate");
    put(kRateAt, 96000, "a rate whose windows are longer");
    put(kChannelsAt, 3, "three channels");
    put(kSpectraAt, 258, "a bin too many");
    put(kSpectraAt, 2147483647, "more than there is");
    put(kSpectraAt + 4, -1e-9, "negative power");
    put(kSpectraAt + 12, 1e300, "endless power");
    auto one = good;
    Put(one, kChannelsAt, 2);
    one.resize(one.size() + 5 * 4);
    refuse(one, "a second channel without spectra");
    auto empty = good;
    empty.resize(kSpectraAt);
    Put(empty, kChannelsAt, 0);
    refuse(empty, "seconds without spectra");
    // An older layout has fewer parameters, in which case the rest stay at their defaults.
    Bytes few = good;
    Put(few, 8, 4);
    few.erase(few.begin() + 12 + 8 * 4, few.begin() + kSecondsAt);
    SetText(denoiser, kSensitivity, "3 dB");
    denoiser.SetSettingsChunk(few);
    EXPECT_EQ(Text(denoiser, kReduction), "40.0 dB");
    EXPECT_EQ(Text(denoiser, kSensitivity), "0.7 dB");
    EXPECT_NEAR(Density(denoiser), 0.01, 0.0005);
}

}  // namespace

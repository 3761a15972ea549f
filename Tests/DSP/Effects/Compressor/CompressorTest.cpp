#include "DSP/Effects/Compressor/Compressor.h"

#include <gtest/gtest.h>

#include <limits>

#include "Support/CompressorProbe.h"

using namespace TestSupport;

// Parameters, chunks and the hand-over between the threads.
namespace {

constexpr std::size_t kRecord = 4, kCounts = kRecord + 96, kPoints = kRecord + 112, kPreset = 16100;

}  // namespace

// Catches a boundary off by one and fields that a short chunk should leave alone.
TEST(Compressor, ReadsChunksAsFarAsTheyGo) {
    Compressor source;
    source.SetPreset(12);
    SetBoth(source, kThreshold, ThresholdPosition(-300));
    SetBoth(source, kRatio, RatioPosition(100));
    auto full = Chunk(source);
    Put<std::int32_t>(full, 0, 77);
    Put<std::int32_t>(full, kRecord + 40, 4711);  // reserved
    ASSERT_EQ(full.size(), 16112u);
    for (const std::size_t length : {16099u, 16100u, 16103u, 16108u, 16111u, 16112u, 16300u}) {
        Compressor effect;
        SetBoth(effect, kThreshold, ThresholdPosition(-50));
        const auto before = Chunk(effect);
        auto chunk = full;
        chunk.resize(length, 0xAA);
        effect.SetSettingsChunk(chunk);
        auto expected = before;
        if (length >= 16100) {
            expected = full;
            for (std::size_t at = kPreset; at < 16112; at += 4)
                if (length < at + 4) Put(expected, at, At<std::int32_t>(before, at));
        }
        EXPECT_EQ(Chunk(effect), expected) << length;
    }
}

// Catches offsets of the older layout, whose words are twice as wide.
TEST(Compressor, ReadsTheOlderLayout) {
    Compressor source;
    source.SetPreset(19);
    SetBoth(source, kRatio, RatioPosition(30));
    const auto today = Chunk(source);
    Bytes old(16208);
    for (std::size_t i = 0; i < 24; ++i)
        Put<std::int64_t>(old, 4 + 8 * i, At<std::int32_t>(today, kRecord + 4 * i));
    std::copy(today.begin() + kCounts, today.end(), old.begin() + 196);
    Compressor effect;
    EXPECT_TRUE(effect.FitsOldChunk(old));
    EXPECT_EQ(Chunk(effect), today);
    old.resize(16195);
    EXPECT_FALSE(effect.FitsOldChunk(old));
}

// Catches trust in numbers from outside: counts, levels, words.
TEST(Compressor, RepairsWhatAChunkHolds) {
    const float nan = std::numeric_limits<float>::quiet_NaN();
    const auto check = [](std::size_t offset, auto value, const std::string& what) {
        Compressor effect;
        auto chunk = Chunk(effect);
        Put(chunk, offset, value);
        effect.SetSettingsChunk(chunk);
        const auto repaired = Chunk(effect);
        const auto count = At<std::int32_t>(repaired, kCounts);
        ASSERT_TRUE(count >= 2 && count <= 666) << what;
        float last = 0.0f;
        for (std::size_t i = 0; i < static_cast<std::size_t>(count); ++i) {
            const auto x = At<float>(repaired, kPoints + 12 * i);
            ASSERT_TRUE(x >= last && x <= 1.0f) << what;
            last = x;
        }
        ASSERT_EQ(last, 1.0f) << what;
        for (const double gain : SteadyGains(effect, Levels(-100.0, 6.0, 3.0), 50))
            ASSERT_LT(gain, 150.0) << what;
    };
    constexpr std::size_t kX = kPoints + 12 * 20, kY = kX + 4;
    check(kX, nan, "no number as x");
    check(kY, nan, "no number as y");
    check(kY, std::numeric_limits<float>::infinity(), "infinite y");
    check(kX, 1e-3f, "descending x");
    check(kX, 3.0f, "x above full scale");
    check(kPoints + 4, 0.5f, "an origin with a level");
    check(kPoints, 1e-5f, "no origin");
    check(kY, -1.0f, "a negative level");
    for (const std::int32_t count : {-1, 0, 1, 666, 667, std::numeric_limits<std::int32_t>::max()})
        check(kCounts, count, "a count of " + std::to_string(count));
}

// Catches automation that the editor never sees, and one that overtakes a preset loaded meanwhile.
TEST(Compressor, AutomationReachesTheEditor) {
    const auto format = Format<float>();
    Compressor effect;
    effect.InitProcessing(64, &format);
    effect.SetParam(kThreshold, ThresholdPosition(-333), true);
    EXPECT_EQ(Text(effect, kThreshold), "-33.3 dB");
    effect.SetParam(kThreshold, ThresholdPosition(-444), true);
    effect.SetPreset(2);
    EXPECT_EQ(Text(effect, kThreshold), "-20.0 dB");
    auto block = Noise<float>(128);
    ProcessBlock(effect, block.data(), 64, format);
    const float attack = effect.GetParam(kAttack);
    effect.SetParam(kAttack, 0.9f, true);
    EXPECT_EQ(effect.GetParam(kAttack), attack) << "only curves come back";
}

#include "DSP/Effects/PitchShift/PitchShift.h"

#include <gtest/gtest.h>

#include <numeric>
#include <stdexcept>

#include "DSP/Pitch/PitchAdapter.h"
#include "Support/AudioThreadRules.h"
#include "Support/EffectRun.h"
#include "Support/TwoThreads.h"

using Corvo::DSP::PitchAdapter;
using Corvo::DSP::PitchShift;
using namespace TestSupport;

namespace {

std::vector<std::uint8_t> ChunkOf(const std::array<std::int32_t, 22>& words, std::size_t width) {
    std::vector<std::uint8_t> chunk(4 + 22 * width, 0xEE);
    for (std::size_t i = 0; i < 22; ++i)
        for (std::size_t byte = 0; byte < 4; ++byte)
            chunk[4 + i * width + byte] =
                static_cast<std::uint8_t>(static_cast<std::uint32_t>(words[i]) >> (8 * byte));
    return chunk;
}

// The default preset's words with a pitch and a back-end of choice.
std::array<std::int32_t, 22> Words(std::int32_t left, std::int32_t right, std::int32_t backEnd) {
    return {left, right, 1000, 1000, 4,    4,    3,    3, 0, 0, -900,
            -900, 20,    20,   2000, 2000, -960, -960, 0, 0, 0, backEnd};
}

}  // namespace

TEST(PitchShift, MapsShowsAndReadsItsPitch) {
    PitchShift effect;
    struct Case {
        float normalised;
        float plain;
        const wchar_t* text;
    } const cases[] = {{0.0f, 10, L"-98.7 semitones - 0.3%"},
                       {0.5f, 3005, L"0.0 semitones - 100.2%"},
                       {1.0f, 6000, L"12.0 semitones - 200.0%"},
                       {(3367.5f - 10) / 5990, 3367, L"2.0 semitones - 112.2%"}};
    for (const auto& c : cases) {
        effect.SetParam(0, c.normalised, false);
        EXPECT_EQ(effect.GetParamPlain(0), c.plain);
        EXPECT_EQ(effect.GetParamPlain(1), c.plain) << "both sides follow the one control";
        EXPECT_EQ(effect.GetParameterFormattedText(0, c.normalised), c.text);
    }
    EXPECT_EQ(effect.GetParamCount(), 1);
    EXPECT_EQ(effect.GetParamName(0), L"Pitch");
    EXPECT_NEAR(effect.GetParamValueNormalizedFromText(0, "12"), 1.0000007f, 1e-6f);
    EXPECT_NEAR(effect.GetParamValueNormalizedFromText(0, "-12 semitones"), 0.24874778f, 1e-6f);
    effect.SetParam(0, effect.GetParamValueNormalizedFromText(0, "-12"), false);
    EXPECT_EQ(effect.GetParamPlain(0), 1499) << "truncated, not 1500";
    EXPECT_THROW(effect.GetParamValueNormalizedFromText(0, "up"), std::invalid_argument);
    EXPECT_EQ(effect.GetParamValueNormalizedFromText(2, "1"), -1.0f);
    EXPECT_EQ(effect.GetParameterFormattedText(2, 0.5), L"");
}

// Catches words dropped or shifted on their way through presets and both chunk layouts.
TEST(PitchShift, KeepsItsWholeRecord) {
    PitchShift effect;
    effect.SetPreset(6);
    EXPECT_EQ(effect.GetPresetName(6), "1 Octave Down");
    auto chunk = Chunk(effect), expected = ChunkOf(Words(1500, 1500, 1), 4);
    std::fill_n(expected.begin(), 4, std::uint8_t{0});
    EXPECT_EQ(chunk, expected);

    std::array<std::int32_t, 22> words;
    std::iota(words.begin(), words.end(), -7);
    PitchShift current, old;
    current.SetSettingsChunk(ChunkOf(words, 4));
    ASSERT_TRUE(old.FitsOldChunk(ChunkOf(words, 8)));
    chunk = Chunk(current);
    std::fill_n(chunk.begin(), 4, std::uint8_t{0});  // the old layout's tag is not taken
    EXPECT_EQ(Chunk(old), chunk);
    auto shortChunk = ChunkOf(words, 8);
    shortChunk.pop_back();
    EXPECT_FALSE(effect.FitsOldChunk(shortChunk));
    EXPECT_EQ(effect.GetParamPlain(0), 1500);
}

// Catches settings that do not reach the back-end, or reach it in another way than a host would set it up.
TEST(PitchShift, DrivesTheBackEndItsRecordNames) {
    for (const int backEnd : {0, 1}) {
        const auto format = Format<float>();
        PitchShift effect;
        effect.InitProcessing(500, &format);  // with the blank record first: the back-end changes later
        effect.SetSettingsChunk(ChunkOf(Words(3300, 2500, backEnd), 4));
        const std::unique_ptr<PitchAdapter> adapter(PitchAdapter::CreateAdapter(backEnd));
        adapter->SetChannelsNum(2);
        adapter->SetSampleRate(48000);
        adapter->SetPitchFactor(0, 1.1f);
        adapter->SetPitchFactor(1, static_cast<float>(2500 * 0.0003333333333333333));
        adapter->SetFFTSize(3);
        adapter->SetQuality(4);
        adapter->CookFactors();
        auto block = Noise<float>(2 * 500), expected = block;
        for (int i = 0; i < 30; ++i) {
            ProcessBlock(effect, block.data(), 500, format);
            adapter->ProcessInPlace(expected.data(), 500);
            ASSERT_EQ(block, expected) << "back-end " << backEnd << ", block " << i;
            block = expected = Noise<float>(2 * 500, 0.25, static_cast<std::uint64_t>(i + 2));
        }
        EXPECT_EQ(effect.GetLatency(), adapter->GetLatency());
        effect.Cleanup();
        EXPECT_EQ(effect.GetLatency(), 0);
        ProcessBlock(effect, block.data(), 500, format);  // makes a new one
        EXPECT_EQ(effect.GetLatency(), adapter->GetLatency());
    }
}

// Catches memory made, freed or waited for by the effect itself; "Classic" has no engine that does so.
TEST(PitchShift, ChangesBackEndsWithoutAllocatingWhileItProcesses) {
    if (!AudioThreadRules::CanCount()) GTEST_SKIP() << "no counters on this build";
    const auto format = Format<float>();
    PitchShift effect;
    effect.InitProcessing(500, &format);
    auto block = Noise<float>(2 * 500);
    for (int i = 0; i < 20; ++i) {
        effect.SetSettingsChunk(ChunkOf(Words(3300 + i, 2500, i % 2), 4));
        effect.SetParam(0, 0.4f, false);
        std::string broken;
        {
            const AudioThreadRules rules;
            ProcessBlock(effect, block.data(), 500, format);
            broken = rules.Broken();
        }
        EXPECT_TRUE(broken.empty() || i % 2 == 1) << broken << " with Classic, round " << i;
    }
}

// Catches a back-end freed in use, and one that is taken but not the record's in the end.
TEST(PitchShift, TakesBackEndsFromAnotherThread) {
    const auto format = Format<float>();
    PitchShift effect;
    effect.InitProcessing(128, &format);
    auto block = Noise<float>(2 * 128);
    const auto process = [&] { ProcessBlock(effect, block.data(), 128, format); };
    for (const int last : {0, 1}) {
        WhileAnotherThread(
            [&](int round) {
                effect.SetSettingsChunk(ChunkOf(Words(2000 + round % 3000, 3000, round % 2), 4));
                effect.SetParam(0, 0.4f, false);
                effect.GetLatency();
            },
            [&] {
                for (int i = 0; i < 300; ++i) process();
            });
        effect.SetSettingsChunk(ChunkOf(Words(2000, 3000, last), 4));
        process();
        EXPECT_EQ(effect.GetLatency() > 0, last == 1) << "only New has a latency to report";
    }
}

// Catches an edit that waits for the next block: a host asks for the latency right behind it.
TEST(PitchShift, SendsAnEditAtOnce) {
    const auto format = Format<float>();
    PitchShift effect;
    effect.SetPreset(0);
    effect.InitProcessing(128, &format);
    const int before = effect.GetLatency();
    effect.SetParam(0, 1.0f, false);
    const int after = effect.GetLatency();
    EXPECT_NE(after, before);
    effect.InitProcessing(128, &format);
    EXPECT_EQ(effect.GetLatency(), after);
}

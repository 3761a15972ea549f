#include "DSP/Effects/Phaser/Phaser.h"

#include <gtest/gtest.h>

#include <bit>

#include "Plain/PlainPhaser.h"
#include "Support/EffectRun.h"

using Corvo::DSP::Phaser;
using namespace TestSupport;

namespace {

enum { kFeedback = 1, kWidth = 5 };

// The settings in the order of the chunk.
struct Settings {
    float rate, feedback, wet, maximum, minimum, width;
    std::int32_t stages;
};

void Load(Phaser& phaser, const Settings& s) {
    std::vector<std::int32_t> words{0};
    for (const float value : {s.rate, s.feedback, s.wet, s.maximum, s.minimum, s.width})
        words.push_back(std::bit_cast<std::int32_t>(value));
    words.push_back(s.stages);
    LoadWords(phaser, words);
}

Plain::Phaser PlainOf(const Settings& s, int rate) {
    return {rate, s.rate, s.feedback, s.wet, s.minimum, s.maximum, static_cast<std::size_t>(s.stages)};
}

}  // namespace

// Catches lanes that are swapped, a rounding left out or added, and a sweep that wraps in another place.
TEST(Phaser, HasTheBitsOfThePlainForm) {
    const Settings cases[] = {
        {1.0f, 0.7f, 0.5f, 1600, 440, 0.25f, 6},      {0.6667f, 0.97f, 0.65f, 10000, 0, 1.0f, 30},
        {0.168f, 0.685f, 0.303f, 680, 4120, 0.1f, 1}, {0.05f, 0.7f, 1.0f, 1600, 440, 0.0f, 0},
        {0.0f, 0.5f, 0.5f, 700, 700, 0.5f, 12},       {0.3f, 0.5f, 0.0f, 700, 900, 0.5f, 30},
    };
    const auto check = [&]<typename Sample>(Sample, const Settings& s, int channels, int rate) {
        constexpr std::size_t kFrames = 30000;
        const auto width = static_cast<std::size_t>(channels);
        const auto input = Noise<Sample>(kFrames * width);
        auto expected = input;
        for (std::size_t c = 0; c < std::min<std::size_t>(width, 2); ++c) {
            auto plain = PlainOf(s, rate);
            if (c == 1) plain.phase = s.width * 6.283185307179586;
            plain.Run(expected.data() + c, kFrames, channels);
        }
        Phaser phaser;
        Load(phaser, s);
        ASSERT_EQ(Render(phaser, input, Format<Sample>(channels, rate), {500, 1, 64, 1023}), expected)
            << s.stages << " stages, " << channels << " channels";
    };
    for (const auto& s : cases)
        for (const int channels : {1, 2, 3}) {
            check(0.0f, s, channels, 48000);
            check(0.0, s, channels, 8000);
        }
}

// Catches a right sweep that is put back by every cook, and one that does not follow the width.
TEST(Phaser, MovesTheRightSweepOnlyWithTheWidth) {
    const Settings s{0.5f, 0.3f, 0.5f, 4000, 300, 0.25f, 4};
    Phaser phaser;
    Load(phaser, s);
    auto left = PlainOf(s, 48000), right = left;
    right.phase = 0.25 * 6.283185307179586;
    const auto format = Format<double>();
    phaser.InitProcessing(13000, &format);
    const auto run = [&](const char* what) {
        auto block = Noise<double>(2 * 13000);
        auto expected = block;
        left.Run(expected.data(), 13000, 2);
        right.Run(expected.data() + 1, 13000, 2);
        ProcessBlock(phaser, block.data(), 13000, format);
        EXPECT_EQ(block, expected) << what;
    };
    run("from the start");
    phaser.SetParam(kFeedback, 0.5f, false);
    left.feedback = right.feedback = 0.5;
    run("after another edit");
    phaser.SetParam(kWidth, 0.75f, false);
    right.phase = left.phase + 0.75 * 6.283185307179586;
    run("after the width");
}

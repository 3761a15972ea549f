#include <functional>

#include "Support/EveryEffect.h"

using namespace TestSupport;

// What every effect promises about edits while a stream runs.
namespace {

using EditSettings = std::function<void(CorvoEffectBase&)>;

// The second of two blocks; the edit is made in front of the first or between them.
std::vector<float> SecondBlock(CorvoEffectBase& effect, const EditSettings& edit, bool whileItRuns) {
    constexpr int kFrames = 4000;
    const auto format = Format<float>(2, 8000);
    Random random(5);
    SetAllParams(effect, random);
    if (!whileItRuns) edit(effect);
    effect.InitProcessing(kFrames, &format);
    std::vector<float> block;
    for (const bool second : {false, true}) {
        block = Noise<float>(2 * kFrames);
        if (second && whileItRuns) edit(effect);
        ProcessBlock(effect, block.data(), kFrames, format);
    }
    return block;
}

}  // namespace

using EveryEffectEdits = EveryEffect;
INSTANTIATE_TEST_SUITE_P(All, EveryEffectEdits, testing::ValuesIn(AllEffects()), EffectTestName);

// Catches settings that are stored and never taken into use: what makes a difference beforehand makes one
// while the stream runs.
TEST_P(EveryEffectEdits, AreHeardWhileTheStreamRuns) {
    const auto expectHeard = [&](const EditSettings& edit, const std::string& what) {
        const auto plain = SecondBlock(
            *Make(), [](auto&) {}, true);
        if (SecondBlock(*Make(), edit, false) != plain) {
            EXPECT_NE(SecondBlock(*Make(), edit, true), plain) << what;
        }
    };
    const auto other = Make();
    for (int index = 0; index < other->GetParamCount(); ++index)
        expectHeard(
            [=](auto& effect) { effect.SetParam(index, effect.GetParam(index) < 0.5f ? 0.9f : 0.1f, false); },
            "parameter " + std::to_string(index));
    for (int preset = 0; preset < other->NumPresets(); preset += 5)
        expectHeard([=](auto& effect) { effect.SetPreset(preset); }, "preset " + std::to_string(preset));
    Random random(8);
    SetAllParams(*other, random);
    expectHeard([chunk = Chunk(*other)](auto& effect) { effect.SetSettingsChunk(chunk); }, "a chunk");
}

// Catches delay lines that play on what was there before the host jumped.
TEST_P(EveryEffectEdits, NothingRingsAfterALightReset) {
    const auto effect = Make();
    const auto format = Format<float>(2, 8000);
    auto block = Render(*effect, Noise<float>(2 * 4000), format, {4000});
    if (!(effect->LongestGap() > 0.0)) GTEST_SKIP() << "has no delay line";
    effect->InitResetProcessingLight(true);
    std::ranges::fill(block, 0.0f);
    ProcessBlock(*effect, block.data(), 4000, format);
    EXPECT_EQ(block, std::vector<float>(block.size()));
}

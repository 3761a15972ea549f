#include <gtest/gtest.h>

#include <stdexcept>

#include "Support/EveryEffect.h"

using namespace TestSupport;

// What every effect promises about parameters, presets and chunks.
namespace {

// What an effect makes of a text: -1 also where it says by throwing that the text holds no number.
float Parsed(CorvoEffectBase& effect, int index, const std::string& text) {
    try {
        return effect.GetParamValueNormalizedFromText(index, text);
    } catch (const std::invalid_argument&) {
        return -1.0f;
    } catch (const std::out_of_range&) {
        return -1.0f;
    }
}

}  // namespace

// Catches knobs that creep when a project is reopened, and rows wired to the wrong field.
TEST_P(EveryEffect, MovesOneParameterAndKeepsItsWord) {
    const auto effect = Make();
    for (int index = 0; index < effect->GetParamCount(); ++index)
        for (int step = 0; step <= 500; ++step) {
            auto expected = AllParams(*effect);
            effect->SetParam(index, static_cast<float>(step) / 500.0f, false);
            const auto stored = Chunk(*effect);
            expected[static_cast<std::size_t>(index)] = effect->GetParam(index);
            if (GetParam().plainFloats) {
                ASSERT_NEAR(effect->GetParam(index), static_cast<float>(step) / 500.0f, 1e-6);
            } else {
                effect->SetParam(index, effect->GetParam(index), false);
                ASSERT_EQ(Chunk(*effect), stored) << "parameter " << index << ", step " << step;
            }
            if (!GetParam().linkedParameters) {
                ASSERT_EQ(AllParams(*effect), expected) << "parameter " << index << ", step " << step;
            }
        }
}

// Catches a field that is not saved, saved twice or read from the wrong place.
TEST_P(EveryEffect, SavesAndLoadsEverySetting) {
    for (int preset = -20; preset < Make()->NumPresets(); ++preset) {
        const auto effect = Make(), other = GetParam().Make();
        if (preset < 0) SetAllParams(*effect, Random(static_cast<std::uint64_t>(preset + 21)));
        effect->SetPreset(preset);
        EXPECT_TRUE(preset < 0 || !effect->GetPresetName(preset).empty());
        if (const int off = GetParam().loadsOff; off >= 0) effect->SetParam(off, 0.0f, false);
        const auto chunk = Chunk(*effect);
        ASSERT_EQ(chunk.size(), static_cast<std::size_t>(effect->GetSettingsChunkSize()));
        other->SetSettingsChunk(chunk);
        ASSERT_EQ(Chunk(*other), chunk) << preset;
        ASSERT_EQ(AllParams(*other), AllParams(*effect)) << preset;
    }
}

// Catches settings that are half loaded. What any bytes do is fuzzed.
TEST_P(EveryEffect, TakesAShortChunkWholeOrNotAtAll) {
    const auto effect = Make(), donor = Make();
    const auto good = Chunk(*effect);
    SetAllParams(*donor, Random(5));
    auto chunk = Chunk(*donor);
    for (auto size = std::min(chunk.size(), GetParam().shortestChunk); size-- > 0; size -= size / 200) {
        chunk.resize(size);
        effect->SetSettingsChunk(chunk);
        ASSERT_EQ(Chunk(*effect), good) << size;
    }
}

// Catches a number from outside that is believed.
TEST_P(EveryEffect, IgnoresPresetNumbersAndIndicesItDoesNotHave) {
    const auto effect = Make();
    const auto before = Chunk(*effect);
    for (const int index : {-1, 1000, effect->GetParamCount(), 1 << 30}) effect->SetParam(index, 0.3f, true);
    for (const int preset : {-1, effect->NumPresets(), 1 << 30}) effect->SetPreset(preset);
    EXPECT_EQ(Chunk(*effect), before);
}

// Catches texts that the effect shows but does not understand, or reads as another value, and nonsense that
// it takes for a value.
TEST_P(EveryEffect, UnderstandsTheTextsItShows) {
    const auto effect = Make();
    for (int index = 0; index < effect->GetParamCount(); ++index) {
        // The host matches the texts of switches and lists itself.
        if (effect->GetParameterTypeAutomatable(index) != Corvo::EffectParameterType::Continuous) continue;
        for (const char* text : {"", "  ", "loud", ".", "+-1", "1e400"})
            EXPECT_EQ(Parsed(*effect, index, text), -1.0f) << "parameter " << index << ", " << text;
        for (int step = 0; step <= 100; ++step) {
            effect->SetParam(index, static_cast<float>(step) / 100.0f, false);
            const auto shown = Text(*effect, index);
            ASSERT_FALSE(shown.empty()) << "parameter " << index;
            const float value = effect->GetParamValueNormalizedFromText(index, shown);
            if (value == -1.0f && step == 0) break;  // this effect parses no text
            ASSERT_TRUE(value >= 0.0f && value <= 1.00001f) << shown;
            effect->SetParam(index, value, false);
            const auto again = Text(*effect, index);
            if (!GetParam().textTruncates) {
                ASSERT_EQ(again, shown) << "parameter " << index;
            } else if (again != shown) {
                ASSERT_NEAR(std::stod(again), std::stod(shown), 0.1001) << "parameter " << index;
            }
        }
    }
}

// Catches automation that an effect says it plays and does not, or the reverse.
TEST_P(EveryEffect, PlaysAutomationIfItSaysSo) {
    const auto effect = Make();
    const auto format = Format<float>();
    const MP_ENVELOPE_SEGMENT segment{0, 0, 0.8125f, 0.8125f, MP_CURVE_JUMP, 0};
    for (int index = 0; index < effect->GetParamCountReal(); ++index) effect->AddEnvelope(index, 1, &segment);
    effect->InitProcessing(64, &format);
    const auto before = AllParams(*effect);
    auto block = Noise<float>(2 * 64);
    ProcessBlock(*effect, block.data(), 64, format);
    EXPECT_EQ(AllParams(*effect) != before, effect->PlaysAutomation());
}

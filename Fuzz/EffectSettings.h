#pragma once

#include <array>
#include <memory>
#include <stdexcept>

#include "DSP/Effects/Framework/CorvoEffectBase.h"
#include "Target.h"

namespace Fuzz {

// What a host asks and sets on the user-interface thread, in any order.
struct EffectSettings {
    Input& input;
    std::unique_ptr<Corvo::DSP::CorvoEffectBase> effect;

    int Parameter() { return input.Between(-1, effect->GetParamCount()); }
    void Edit() {
        const int index = Parameter();
        effect->SetParam(index, input.Value(), false);
        const float value = effect->GetParam(index);
        Require(value >= 0.0f && value <= 1.0f, "a parameter is 0..1");
    }
    void AskTexts() {
        const int index = Parameter();
        effect->GetParameterFormattedText(index, input.Flag() ? input.Raw<double>() : input.Value());
        effect->GetParamName(index);
        effect->GetParamUnitsText(index);
        effect->GetParamPlain(index);
        effect->GetParamFromProp(index, input.Between(-1, effect->NumPresets()));
        if (index >= 0 && index < effect->GetParamCount()) effect->Describe(index);
    }
    // What the effect writes itself with a character changed, or any text.
    void Parse() try {
        const int index = Parameter();
        std::string text = input.Text(40);
        if (input.Flag()) {
            const auto wide = effect->GetParameterFormattedText(index, input.Value());
            text.assign(wide.begin(), wide.end());
            if (!text.empty()) text[input.Raw<std::uint8_t>() % text.size()] = input.Raw<char>();
        }
        const float value = effect->GetParamValueNormalizedFromText(index, text);
        const bool limited = effect->GetName() != "Pitch Shift";  // whose formula has no limits
        Require(!limited || value == -1.0f || (value >= 0.0f && value <= 1.0f), "a text is 0..1 or -1");
    } catch (const std::invalid_argument&) {
    } catch (const std::out_of_range&) {
    }
    // The effect's own chunk with some words changed or cut short, or any bytes.
    void Chunk() {
        std::vector<std::uint8_t> chunk, taken, again;
        effect->GetSettingsChunk(chunk);
        Require(chunk.size() == static_cast<std::size_t>(effect->GetSettingsChunkSize()), "a chunk's size");
        if (input.Flag()) chunk = input.Bytes(20000);
        for (int i = input.Between(0, 8); i > 0 && chunk.size() >= 4; --i)
            *reinterpret_cast<std::array<std::uint8_t, 4>*>(
                &chunk[input.Raw<std::uint16_t>() % (chunk.size() / 4) * 4]) =
                input.Raw<std::array<std::uint8_t, 4>>();
        if (input.Between(0, 7) == 0) chunk.resize(input.Raw<std::uint16_t>() % (chunk.size() + 1));
        effect->SetSettingsChunk(chunk);
        effect->GetSettingsChunk(taken);
        effect->SetSettingsChunk(taken);
        effect->GetSettingsChunk(again);
        Require(taken == again, "an effect's own chunk comes back as it was");
        for (int i = 0; i < effect->GetParamCount(); ++i) {
            const float value = effect->GetParam(i);
            Require(value >= 0.0f && value <= 1.0f, "a parameter is 0..1");
            effect->GetParameterFormattedText(i, value);
        }
    }
    void Preset() { effect->SetPreset(input.Between(-1, effect->NumPresets())); }
};

}  // namespace Fuzz

#pragma once

#include <string>

#include "Threads/SharedRecord.h"

namespace Corvo::DSP {

// Parameters and presets of an effect whose settings are pairs of words, left and right, in a record that the
// two threads share. A row says by `map` what a normalised value means, and by `field` and `side` which word
// it is; a preset has a `name` and whole `settings`. Indices are those of the tables; what is off them
// changes nothing and is 0, nameless or, in a preset, -1.
template <const auto& kRows, const auto& kPresets>
struct PairedWords {
    static constexpr int kCount = static_cast<int>(kRows.size());
    static constexpr int kPresetCount = static_cast<int>(kPresets.size());

    static bool Has(int index) { return index >= 0 && index < kCount; }
    static bool HasPreset(int preset) { return preset >= 0 && preset < kPresetCount; }
    static const auto& RowAt(int index) { return kRows[static_cast<std::size_t>(index)]; }
    static const auto& PresetAt(int preset) { return kPresets[static_cast<std::size_t>(preset)]; }

    static bool Set(auto& record, int index, float normalised) {
        if (Has(index)) StoreShared(WordOf(record, index), RowAt(index).map.Word(normalised));
        return Has(index);
    }
    static float Plain(const auto& record, int index) {
        return Has(index) ? static_cast<float>(LoadShared(WordOf(record, index))) : 0.0f;
    }
    static float Normalised(const auto& record, int index) {
        return Has(index) ? RowAt(index).map.Normalised(LoadShared(WordOf(record, index))) : 0.0f;
    }

    static float InPreset(int index, int preset) {
        if (!Has(index) || !HasPreset(preset)) return -1.0f;
        return RowAt(index).map.Normalised(WordOf(PresetAt(preset).settings, index));
    }
    static std::string PresetName(int preset) { return HasPreset(preset) ? PresetAt(preset).name : ""; }
    static bool TakePreset(auto& record, int preset) {
        if (HasPreset(preset)) Assign(record, PresetAt(preset).settings);
        return HasPreset(preset);
    }

private:
    static auto& WordOf(auto& record, int index) { return (record.*RowAt(index).field)[RowAt(index).side]; }
};

}  // namespace Corvo::DSP

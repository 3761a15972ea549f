#pragma once

#include <algorithm>
#include <span>
#include <string>
#include <vector>

#include "DSP/Effects/Parameters/ParameterRow.h"

namespace Corvo::DSP {

// The words of a settings record, whatever their types.
using SettingsWords = std::vector<std::uint32_t>;

template <typename Record>
SettingsWords WordsOf(const Record& record) {
    const auto words = std::bit_cast<std::array<std::uint32_t, sizeof(Record) / 4>>(record);
    return {words.begin(), words.end()};
}
template <typename Record>
Record RecordOf(const SettingsWords& words) {
    std::array<std::uint32_t, sizeof(Record) / 4> whole;
    std::ranges::copy(words, whole.begin());
    return std::bit_cast<Record>(whole);
}

template <typename Record>
constexpr std::size_t kWordsOf = sizeof(Record) / 4;

struct PresetRow {
    std::string name;
    SettingsWords settings;
};

// The rows of a table of presets, each with a `name` and whole `settings`.
template <typename Presets>
std::vector<PresetRow> PresetsOf(const Presets& presets) {
    std::vector<PresetRow> rows;
    for (const auto& preset : presets) rows.push_back({preset.name, WordsOf(preset.settings)});
    return rows;
}

// The settings chunk is a leading word, where there is one, and the words of the record, 4 bytes each.
struct ChunkLayout {
    std::size_t words;
    bool leadingWord = true;
    // Older layouts, 0 where there was none: chunks of exactly `wordsBefore` words, and chunks of `wideWords`
    // words of 8 bytes each, of which the first 4 count. Words that they lack are 0.
    std::size_t wordsBefore = 0, wideWords = 0;

    int Size() const { return static_cast<int>(Size(words, 4)); }
    void Write(std::vector<std::uint8_t>& chunk, std::int32_t leading, const SettingsWords& settings) const;
    // False, with nothing changed, when the chunk is too short. ReadWide takes the layout of wide words.
    bool Read(const std::vector<std::uint8_t>& chunk, std::int32_t& leading, SettingsWords& settings) const;
    bool ReadWide(const std::vector<std::uint8_t>& chunk, std::int32_t& leading,
                  SettingsWords& settings) const;

private:
    std::size_t Size(std::size_t count, std::size_t width) const {
        return (leadingWord ? 4 : 0) + count * width;
    }
    bool Take(const std::vector<std::uint8_t>& chunk, std::size_t count, std::size_t width,
              std::int32_t& leading, SettingsWords& settings) const;
};

// A pad of the host's XY editor: the real parameters that its axes move.
struct Pad {
    std::string name;
    std::vector<int> x, y;
};

// The name that GetParamSectionInfo gives a parameter: none, its label, or its label without the side.
enum class SectionLabel { None, Whole, WithoutSide };

// The rows as records of the system, texts cut to the length of their fields.
std::vector<MP_PARAMINFO> RecordsOf(std::span<const ParameterRow> rows, MP_CAPS caps);

// Whose input has samples that are not finite replaced by 0 before processing sees them.
enum class InputGuard {
    FloatFormats,  // blocks of 32 and 64 bits
    EveryFormat,   // all: the effect takes every width but 64 bits for float
    None           // none: the effect remembers nothing, or guards what it keeps
};

// All that is constant about an effect. Made once, when the first instance is, and
// there for the life of the library; the rows are static data of the effect.
struct EffectTable {
    std::string name, image{}, icon{};
    std::span<const ParameterRow> rows;
    ChunkLayout chunk;
    std::vector<PresetRow> presets{};
    int defaultPreset = 0;
    std::vector<Pad> pads{};
    std::vector<std::string> padNames{};  // in the host's list; the pads' own where it is empty
    std::vector<std::string> sections{};
    SectionLabel sectionLabel = SectionLabel::Whole;
    MP_CAPS caps = 1;
    bool playsAutomation = true;
    InputGuard inputGuard = InputGuard::FloatFormats;
    std::vector<MP_PARAMINFO> records = RecordsOf(rows, caps);

    const ParameterRow* Row(int real) const { return At(rows, real); }
    const PresetRow* Preset(int preset) const { return At(std::span<const PresetRow>(presets), preset); }

private:
    template <typename T>
    static const T* At(std::span<const T> all, int index) {
        return index >= 0 && static_cast<std::size_t>(index) < all.size()
                   ? &all[static_cast<std::size_t>(index)]
                   : nullptr;
    }
};

}  // namespace Corvo::DSP

#include "DSP/Effects/Parameters/EffectTable.h"

#include <iterator>
#include <string_view>

#include "DSP/Effects/Parameters/SettingsChunk.h"

namespace Corvo::DSP {
namespace {

// A text that fills its field has no terminator left.
template <std::size_t N>
void Fill(wchar_t (&field)[N], std::wstring_view text) {
    std::ranges::copy(text.substr(0, N - 1), field);
}

}  // namespace

void ChunkLayout::Write(std::vector<std::uint8_t>& chunk, std::int32_t leading,
                        const SettingsWords& settings) const {
    ChunkWriter write(chunk, Size(words, 4));
    if (leadingWord) write(leading);
    for (const auto word : settings) write(word);
}

bool ChunkLayout::Read(const std::vector<std::uint8_t>& chunk, std::int32_t& leading,
                       SettingsWords& settings) const {
    const bool before = wordsBefore > 0 && chunk.size() == Size(wordsBefore, 4);
    return Take(chunk, before ? wordsBefore : words, 4, leading, settings);
}

bool ChunkLayout::ReadWide(const std::vector<std::uint8_t>& chunk, std::int32_t& leading,
                           SettingsWords& settings) const {
    return wideWords > 0 && Take(chunk, wideWords, 8, leading, settings);
}

bool ChunkLayout::Take(const std::vector<std::uint8_t>& chunk, std::size_t count, std::size_t width,
                       std::int32_t& leading, SettingsWords& settings) const {
    if (chunk.size() < Size(count, width)) return false;
    ChunkReader read(chunk);
    if (leadingWord) read(leading);
    settings.assign(words, 0);
    for (std::size_t i = 0; i < count; ++i) read(settings[i]) && read.Skip(width - 4);
    return true;
}

std::vector<MP_PARAMINFO> RecordsOf(std::span<const ParameterRow> rows, MP_CAPS caps) {
    std::vector<MP_PARAMINFO> records;
    for (const auto& row : rows) {
        MP_PARAMINFO record{};
        record.mpType = row.type;
        record.mopCaps = caps;
        record.mpdMinValue = row.range.minimum;
        record.mpdMaxValue = row.range.maximum;
        record.mpdNeutralValue = row.range.neutral;
        Fill(record.szUnitText, row.unit);
        Fill(record.szLabel, row.label);
        records.push_back(record);
    }
    return records;
}

}  // namespace Corvo::DSP

#include <algorithm>

#include "DSP/Effects/Framework/CorvoEffectBase.h"
#include "DSP/Effects/Parameters/EffectTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "Threads/SharedRecord.h"

// What an effect's table answers.
namespace Corvo::DSP {

CorvoEffectBase::CorvoEffectBase(const EffectTable& table, void* settings) : CorvoEffectBase() {
    m_table = &table;
    m_words = settings;
}

const ParameterRow* CorvoEffectBase::RealRow(int real) const {
    return m_table ? m_table->Row(real) : nullptr;
}
const ParameterRow* CorvoEffectBase::WordRow(int real) const {
    const ParameterRow* const row = m_words ? RealRow(real) : nullptr;
    return row && row->word != kNoWord ? row : nullptr;
}
const ParameterRow* CorvoEffectBase::RowOf(int external) { return RealRow(RealIndex(external)); }

int CorvoEffectBase::RealIndex(int external) {
    const int count = GetParamCountReal();
    if (external < 0 || external >= count) return -1;  // any number may be asked for
    const int real = SeparateLeftRightControls() == 0 ? 2 * external : external;
    return m_reverse_param_order ? count - real - 1 : real;
}

const MP_PARAMINFO* CorvoEffectBase::TableRecords() const {
    return m_table ? m_table->records.data() : nullptr;
}

std::string CorvoEffectBase::GetName() { return m_table ? m_table->name : ""; }
std::string CorvoEffectBase::GetImage() { return m_table ? m_table->image : ""; }
std::string CorvoEffectBase::GetPluginIconPath() { return m_table ? m_table->icon : ""; }
bool CorvoEffectBase::PlaysAutomation() const { return !m_table || m_table->playsAutomation; }
double CorvoEffectBase::LongestGap() const { return m_longest_gap; }

int CorvoEffectBase::GetParamCountReal() { return m_table ? static_cast<int>(m_table->rows.size()) : 0; }

bool CorvoEffectBase::DoSetParam(int index, float normalised, bool) {
    const ParameterRow* const row = WordRow(index);
    if (row) StoreWord(m_words, row->word, row->storage.store(row->storage, normalised));
    return row != nullptr;
}

float CorvoEffectBase::GetParam(int index) {
    const ParameterRow* const row = WordRow(RealIndex(index));
    return row ? row->storage.normalised(row->storage, LoadWord(m_words, row->word)) : 0.0f;
}

float CorvoEffectBase::GetParamPlain(int index) const {
    const ParameterRow* const row = WordRow(index);
    return row ? row->storage.plain(LoadWord(m_words, row->word)) : 0.0f;
}

std::wstring CorvoEffectBase::GetParamName(int index) {
    const ParameterRow* const row = RowOf(index);
    return row ? row->label : L"";
}

std::wstring CorvoEffectBase::GetParamUnitsText(int index) {
    const ParameterRow* const row = RowOf(index);
    return row ? row->unit : L"";
}

std::wstring CorvoEffectBase::GetParameterFormattedText(int index, double value) {
    const ParameterRow* const row = RowOf(index);
    return row && row->shown.text ? row->shown.text(*row, value) : L"";
}

float CorvoEffectBase::GetParamValueNormalizedFromText(int index, std::string text) {
    const ParameterRow* const row = RowOf(index);
    return row && row->shown.read ? row->shown.read(*row, text) : -1.0f;
}

std::vector<std::string> CorvoEffectBase::GetParameterAvailableValues(int index) {
    std::vector<std::string> values;
    if (const ParameterRow* const row = RowOf(index))
        for (const auto& choice : row->shown.choices) values.emplace_back(choice.text);
    return values;
}

std::vector<std::string> CorvoEffectBase::GetParamUiSections() {
    return m_table ? m_table->sections : std::vector<std::string>{};
}

void CorvoEffectBase::GetParamSectionInfo(int index, PluginParameterInfo& info) {
    const ParameterRow* const row = RowOf(index);
    if (!row || m_table->sectionLabel == SectionLabel::None) return;
    info = {};
    info.param_index = RealIndex(index);
    info.layout_group = row->section;
    info.values = GetParameterAvailableValues(index);
    info.label = Narrow(m_table->sectionLabel == SectionLabel::Whole ? row->label : GetParamName(index));
}

bool CorvoEffectBase::WantsXySerialization() { return m_table && !m_table->pads.empty(); }

void CorvoEffectBase::InitializeXyEditingData(GenericUIData& data) {
    if (!WantsXySerialization()) return;
    data.groups.clear();
    for (const auto& pad : m_table->pads)
        data.groups.push_back(MakeGroup(pad.name, static_cast<int>(data.groups.size()), pad.x, pad.y));
    data.entries = m_table->padNames;
    if (!data.entries.empty()) return;
    for (const auto& pad : m_table->pads)
        if (data.entries.empty() || data.entries.back() != pad.name) data.entries.push_back(pad.name);
}

ParameterDescription CorvoEffectBase::Describe(int index) {
    ParameterDescription description;
    description.real = RealIndex(index);
    description.label = description.name = Narrow(GetParamName(index));
    description.unit = Narrow(GetParamUnitsText(index));
    description.type = GetParameterTypeAutomatable(index);
    const ParameterRow* const row = RowOf(index);
    if (!row) {
        const auto texts = GetParameterAvailableValues(index);
        const auto last = static_cast<float>(texts.size()) - 1.0f;
        for (const auto& text : texts)
            description.choices.push_back({text, static_cast<float>(description.choices.size()) / last});
        return description;
    }
    if (SeparateLeftRightControls() != 0) description.label = Narrow(row->label);
    const auto& [minimum, maximum, neutral] = row->range;
    description.neutral = minimum == 0.0f && maximum == 1.0f
                              ? neutral
                              : row->storage.normalised(row->storage, std::bit_cast<std::uint32_t>(neutral));
    for (const auto& [text, value] : row->shown.choices) description.choices.push_back({text, value});
    if (description.type == EffectParameterType::Switch && description.choices.empty())
        for (const float value : {0.0f, 1.0f}) {
            const auto text = Narrow(GetParameterFormattedText(index, value));
            description.choices.push_back({std::string(Trimmed(text)), value});
        }
    return description;
}

int CorvoEffectBase::NumPresets() { return m_table ? static_cast<int>(m_table->presets.size()) : 0; }
int CorvoEffectBase::GetDefaultPreset() { return m_table ? m_table->defaultPreset : 0; }

std::string CorvoEffectBase::GetPresetName(int preset) {
    const PresetRow* const row = m_table ? m_table->Preset(preset) : nullptr;
    return row ? row->name : "";
}

void CorvoEffectBase::SetPreset(int preset) { TakePreset(preset); }

float CorvoEffectBase::GetParamFromProp(int index, int preset) {
    const ParameterRow* const row = WordRow(index);
    const PresetRow* const settings = row ? m_table->Preset(preset) : nullptr;
    return settings ? row->storage.normalised(row->storage, settings->settings[row->word]) : -1.0f;
}

int CorvoEffectBase::GetSettingsChunkSize() { return m_table ? m_table->chunk.Size() : 0; }

// An effect that keeps no leading word of its own writes the version of its layout there.
constexpr std::int32_t kChunkVersion = 1;

void CorvoEffectBase::GetSettingsChunk(std::vector<std::uint8_t>& chunk) { WriteChunk(chunk, kChunkVersion); }

void CorvoEffectBase::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    std::int32_t version;
    TakeChunk(chunk, version);
}

void CorvoEffectBase::WriteChunk(std::vector<std::uint8_t>& chunk, std::int32_t leading) const {
    if (!m_table) return;
    SettingsWords settings(m_table->chunk.words);
    for (std::size_t word = 0; word < settings.size(); ++word) settings[word] = LoadWord(m_words, word);
    m_table->chunk.Write(chunk, leading, settings);
}

bool CorvoEffectBase::TakePreset(int preset) {
    const PresetRow* const row = m_table ? m_table->Preset(preset) : nullptr;
    if (row) Store(row->settings);
    return row != nullptr;
}

bool CorvoEffectBase::TakeChunk(const std::vector<std::uint8_t>& chunk, std::int32_t& leading, bool wide) {
    SettingsWords settings;
    const auto read = wide ? &ChunkLayout::ReadWide : &ChunkLayout::Read;
    if (!m_table || !(m_table->chunk.*read)(chunk, leading, settings)) return false;
    Store(settings);
    return true;
}

void CorvoEffectBase::Store(const std::vector<std::uint32_t>& settings) {
    for (std::size_t word = 0; word < settings.size(); ++word) StoreWord(m_words, word, settings[word]);
    MarkStale();
}

}  // namespace Corvo::DSP

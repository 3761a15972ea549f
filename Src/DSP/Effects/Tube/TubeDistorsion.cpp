#include "DSP/Effects/Tube/TubeDistorsion.h"

#include <algorithm>
#include <bit>
#include <cmath>

#include "DSP/Effects/Parameters/EffectTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Effects/Tube/TubeOversampling.h"
#include "DSP/Effects/Tube/TubePresets.h"
#include "DSP/Effects/Tube/TubeRecentInput.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Threads/LatestValue.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

// Values are stored as they come.
constexpr Storage kAsItComes{[](const Storage&, float n) { return std::bit_cast<std::uint32_t>(n); },
                             PlainOfReal,
                             [](const Storage&, std::uint32_t word) { return Limited(PlainOfReal(word)); }};

// A percentage with a word for the quarter it is in, "Weak | 33"; the word follows the number shown, so that
// a text read back shows the same word.
template <const std::array<const char*, 4>& kQuarters>
constexpr Shown Quarters() {
    return {[](const ParameterRow&, double value) {
                const auto percent = std::lround(Limited(static_cast<float>(value)) * 100.0);
                return Widen(kQuarters[static_cast<std::size_t>(std::min(percent / 25, 3l))]) + L" | " +
                       FormatInteger(percent);
            },
            [](const ParameterRow&, const std::string& text) {
                const auto bar = text.find('|');
                return Limited(ParseNumber(bar == text.npos ? text : text.substr(bar + 1)) / 100.0f);
            }};
}
constexpr std::array kBoosts{"None", "Weak", "Tiny", "Strong"}, kDrives{"Easy", "Fast", "Angry", "Furious"},
    kTones{"Obscure", "Cloudy", "Bright", "Holy"};

constexpr std::array<Choice, 4> kFunctions{
    {{"Martens", 0.125f}, {"Doidic S.", 0.375f}, {"Doidic A.", 0.625f}, {"Araya-S.", 0.875f}}};
constexpr Shown kFunctionShown{[](const ParameterRow&, double value) {
                                   const int function =
                                       VirtualTubeAmp::FunctionIndex(static_cast<float>(value));
                                   return Widen(kFunctions[static_cast<std::size_t>(function)].text);
                               },
                               ParameterTexts::ReadChoice,
                               1.0,
                               0,
                               0,
                               kFunctions};

constexpr std::array<Choice, 6> kFactors{
    {{"1", 0.0f}, {"2", 0.24f}, {"4", 0.48f}, {"8", 0.64f}, {"12", 0.76f}, {"16", 0.9f}}};
// A number typed that is none of 2, 4, 8 and 12 is the highest factor, 1 too.
float ReadFactor(const ParameterRow&, const std::string& text) {
    const float number = ParseNumber(text);
    for (const auto& choice : std::span(kFactors).subspan(1))
        if (number == ParseNumber(choice.text)) return choice.value;
    return kFactors.back().value;
}
constexpr Shown kFactorShown{[](const ParameterRow& row, double value) {
                                 const int factor =
                                     VirtualTubeAmp::OversamplingFactor(static_cast<float>(value));
                                 return WithUnit(FormatInteger(factor), row.unit);
                             },
                             ReadFactor,
                             1.0,
                             0,
                             0,
                             kFactors};

constexpr std::size_t kOversamplingRight = 9;
// clang-format off
constexpr std::array<ParameterRow, VirtualTubeAmp::kParameters> kRows{{
    // label             unit        type       kept as     shown as              word
    {L"Boost L",         L"Amount ", MPT_FLOAT, kAsItComes, Quarters<kBoosts>(),  0},
    {L"Boost R",         L"Amount ", MPT_FLOAT, kAsItComes, Quarters<kBoosts>(),  1},
    {L"Drive L",         L"Amount ", MPT_FLOAT, kAsItComes, Quarters<kDrives>(),  2},
    {L"Drive R",         L"Amount ", MPT_FLOAT, kAsItComes, Quarters<kDrives>(),  3},
    {L"Tone L",          L" ",       MPT_FLOAT, kAsItComes, Quarters<kTones>(),   4},
    {L"Tone R",          L" ",       MPT_FLOAT, kAsItComes, Quarters<kTones>(),   5},
    {L"Function L",      L"Type",    MPT_ENUM,  kAsItComes, kFunctionShown,       6},
    {L"Function R",      L"Type",    MPT_ENUM,  kAsItComes, kFunctionShown,       7},
    {L"Oversampling L",  L"x ",      MPT_ENUM,  kAsItComes, kFactorShown,         8},
    {L"Oversampling R",  L"x ",      MPT_ENUM,  kAsItComes, kFactorShown,         kOversamplingRight},
}};
// clang-format on

EffectTable MakeTable() {
    EffectTable table{.name = "Valvex",
                      .image = "builtinTube.png",
                      .icon = "BuiltinPlugins/valvex.png",
                      .rows = kRows,
                      .chunk = {.words = kRows.size()},
                      .sectionLabel = SectionLabel::WithoutSide,
                      .inputGuard = InputGuard::EveryFormat};
    for (const auto& preset : TubePresets::kPresets) {
        VirtualTubeAmp::Values values;
        for (std::size_t i = 0; i < values.size(); ++i) values[i] = preset.values[i / 2];
        table.presets.push_back({preset.name, WordsOf(values)});
        table.padNames.emplace_back(TubePresets::kGroupNames[static_cast<std::size_t>(preset.group)]);
    }
    // Boost against drive, for each kind of preset.
    for (const auto* group : TubePresets::kGroupNames) table.pads.push_back({group, {0, 1}, {2, 3}});
    return table;
}

const EffectTable& Table() {
    static const EffectTable table = MakeTable();
    return table;
}

}  // namespace

// What blocks are processed with. All of it is the audio thread's, but for the draft of the filters.
struct TubeDistorsion::Processing {
    LatestValue<TubeOversampling> filters;
    VirtualTubeAmp amp;
    TubeRecentInput recent;
    TubeBuffer buffer;
    tWAVEFORMATEX format{};
    Values cooked{};

    // Starts from silence.
    void Clear(int factor) {
        filters.Take();
        filters.Taken().Clear(factor);
        recent.Clear();
    }

    // Takes what was prepared, and comes to `factor` by itself where nobody prepared it: automation asks for
    // it in the middle of a block.
    void FollowFactor(int factor) {
        const int channels = format.nChannels;
        if (channels < 1 || channels > MaxNumChannels) return;  // blocks pass unchanged
        const bool prepared = filters.Take() != nullptr;
        auto& live = filters.Taken();
        if (live.Factor() != factor)
            live.Clear(factor);
        else if (!prepared)
            return;
        auto warmUp = recent.Samples(channels);
        live.Process(amp, buffer, warmUp.data(), TubeRecentInput::kFrames, channels);
    }

    template <typename Sample>
    void Process(Sample* samples, int frames, int channels) {
        amp.FilterTone(samples, frames, channels);
        recent.Add(samples, frames, channels);
        filters.Taken().Process(amp, buffer, samples, frames, channels);
    }
};

TubeDistorsion::TubeDistorsion()
    : CorvoEffect(Table(), &m_params), m_processing(std::make_unique<Processing>()) {
    SetPreset(GetDefaultPreset());
}
TubeDistorsion::~TubeDistorsion() = default;

bool TubeDistorsion::AllowChangeParamFromInputBox(int index) { return RealRow(index) != nullptr; }

int TubeDistorsion::WantedFactor() const {
    return VirtualTubeAmp::OversamplingFactor(LoadShared(m_params[kOversamplingRight]));
}

int TubeDistorsion::GetLatency() {
    const int factor = WantedFactor();
    return factor == 1 ? 0 : static_cast<int>(std::lround(TubeOversampling::Delay(factor)));
}

bool TubeDistorsion::DoSetParam(int index, float normalised, bool fromAutomation) {
    if (index == static_cast<int>(kOversamplingRight) && !fromAutomation) PrepareOversampling(normalised);
    return CorvoEffect::DoSetParam(index, normalised, fromAutomation);
}

void TubeDistorsion::SetPreset(int preset) {
    if (const float wanted = GetParamFromProp(kOversamplingRight, preset); wanted >= 0.0f)
        PrepareOversampling(wanted);
    TakePreset(preset);
}

void TubeDistorsion::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    SettingsWords settings;
    std::int32_t leading;
    if (!Table().chunk.Read(chunk, leading, settings)) return;
    PrepareOversampling(PlainOfReal(settings[kOversamplingRight]));
    TakeChunk(chunk, m_chunk_tag);
}

// Before the value is stored: a cook that sees it finds the filters there.
void TubeDistorsion::PrepareOversampling(float wanted) {
    const int factor = VirtualTubeAmp::OversamplingFactor(wanted);
    if (factor == m_prepared_factor) return;
    m_prepared_factor = factor;
    m_processing->filters.Draft().Clear(factor);
    m_processing->filters.Publish();
}

void TubeDistorsion::SetMaximumFramesPerBuffer(int frames) { m_max_frames = frames; }
void TubeDistorsion::AllocateBuffers() { m_processing->buffer.Prepare(m_max_frames); }
void TubeDistorsion::FreeBuffers() { m_processing->buffer.Free(); }

void TubeDistorsion::Cleanup() {
    FreeBuffers();
    m_processing->Clear(WantedFactor());
    m_processing->amp.ClearMemories();
}

void TubeDistorsion::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const bool fromSilence = force || format->nChannels != m_processing->format.nChannels;
    const auto cook = TakeCook(m_processing->format, *format, force);
    if (force) AllocateBuffers();
    if (cook.due) InitState(fromSilence);
}

void TubeDistorsion::InitState(bool fromSilence) {
    InitEnvelopes(true);
    const auto values = Snapshot(m_params);
    auto& amp = m_processing->amp;
    const int factor = VirtualTubeAmp::OversamplingFactor(values[kOversamplingRight]);
    if (fromSilence) {
        m_processing->Clear(factor);
        amp.SetParameter(values, VirtualTubeAmp::kAllParameters);
    }
    using Bits = std::array<std::uint32_t, std::tuple_size_v<Values>>;
    const auto now = std::bit_cast<Bits>(values), before = std::bit_cast<Bits>(m_processing->cooked);
    for (std::size_t i = 0; i < now.size(); ++i)
        if (now[i] != before[i]) amp.SetParameter(values, static_cast<int>(i));
    m_processing->cooked = values;
    if (!fromSilence) m_processing->FollowFactor(factor);
}

void TubeDistorsion::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    const int channels = format->nChannels;
    if (frames < 1 || channels < 1 || channels > MaxNumChannels) return;
    WithSamples(buffer, *format, OtherWidths::AreFloat,
                [&](auto* samples) { m_processing->Process(samples, frames, channels); });
}

}  // namespace Corvo::DSP

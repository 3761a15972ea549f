#include "DSP/Effects/Phaser/Phaser.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <utility>

#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Effects/Parameters/WordChunk.h"
#include "DSP/Effects/Phaser/PhaserImpl.h"
#include "DSP/Effects/Phaser/PhaserKernel.h"
#include "DSP/Effects/Phaser/PhaserPresets.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

using PhaserPresets::kPresets;

struct Row {
    const wchar_t *label, *unit;
    float PhaserSettings::*field;
    float span;    // of the stored value
    double shown;  // per unit of the stored value
    int decimals;
};

// clang-format off
constexpr std::array<Row, 6> kRows{{
    // label               unit   field                      span      shown decimals
    {L"Rate",              L"Hz", &PhaserSettings::rate,         1.0f,   6.0, 2},
    {L"Feedback",          L"%",  &PhaserSettings::feedback,     1.0f, 100.0, 0},
    {L"Wet",               L"%",  &PhaserSettings::wet,          1.0f, 100.0, 0},
    {L"Minimum frequency", L"Hz", &PhaserSettings::minimum,  10000.0f,   1.0, 0},
    {L"Maximum frequency", L"Hz", &PhaserSettings::maximum,  10000.0f,   1.0, 0},
    {L"Stereo width",      L"%",  &PhaserSettings::width,        1.0f, 100.0, 0},
}};
// clang-format on
constexpr int kStages = static_cast<int>(kRows.size()), kCount = kStages + 1;

constexpr std::int32_t kChunkVersion = 1;
constexpr double kRateHz = 6.0;

bool Has(int index) { return index >= 0 && index < kCount; }
bool HasPreset(int preset) { return preset >= 0 && preset < static_cast<int>(kPresets.size()); }
const Row& RowAt(int index) { return kRows[static_cast<std::size_t>(index)]; }

// Within 0..limit; NaN counts as 0.
float Limited(float value, float limit = 1.0f) { return value > 0.0f ? std::min(value, limit) : 0.0f; }

std::int32_t StagesFrom(float normalised) {
    return 1 - static_cast<std::int32_t>(Limited(normalised) * -29.0f);
}

// The normalised value that `map` makes `wanted` of, close to `guess`: the division may have rounded to a
// neighbour of it.
template <typename Map, typename Value>
float Inverse(Map map, Value wanted, float guess) {
    guess = Limited(guess);
    for (float below = guess, above = guess, step = 0; step < 4; ++step) {
        if (map(below) == wanted) return below;
        if (map(above) == wanted) return above;
        below = Limited(std::nextafter(below, 0.0f));
        above = Limited(std::nextafter(above, 1.0f));
    }
    return guess;
}

float NormalisedOf(const PhaserSettings& settings, int index) {
    if (index == kStages)
        return Inverse(StagesFrom, settings.stages, (static_cast<float>(settings.stages) - 1.0f) / 29.0f);
    const Row& row = RowAt(index);
    const float value = settings.*row.field;
    return Inverse([&row](float n) { return n * row.span; }, value, value / row.span);
}

constexpr auto kVisitSettings = [](auto&& visit, auto& s) {
    return visit(s.rate) && visit(s.feedback) && visit(s.wet) && visit(s.maximum) && visit(s.minimum) &&
           visit(s.width) && visit(s.stages);
};
using SettingsChunk = WordChunk<PhaserSettings, kVisitSettings>;

}  // namespace

Phaser::Phaser() {
    for (auto& engine : m_engines) engine = std::make_shared<PhaserImpl>();
    SetPreset(0);
}
Phaser::~Phaser() = default;

bool Phaser::HasSeparateLeftRightSettings() { return false; }
bool Phaser::SupportsNoninterleaved() { return true; }
int Phaser::GetParamCountReal() { return kCount; }
int Phaser::GetSettingsChunkSize() { return SettingsChunk::kSize; }
int Phaser::NumPresets() { return static_cast<int>(kPresets.size()); }
std::string Phaser::GetName() { return "Phaser"; }
std::string Phaser::GetImage() { return "builtinPhaser.png"; }
std::string Phaser::GetPluginIconPath() { return "BuiltinPlugins/Phaser@3x.png"; }
bool Phaser::WantsXySerialization() { return true; }

std::wstring Phaser::GetParamName(int index) {
    return !Has(index) ? L"" : index == kStages ? L"Stages" : RowAt(index).label;
}

std::wstring Phaser::GetParamUnitsText(int index) {
    return Has(index) && index != kStages ? RowAt(index).unit : L"";
}

bool Phaser::DoSetParam(int index, float normalised, bool) {
    if (!Has(index)) return true;
    if (index == kStages)
        StoreShared(m_settings.stages, StagesFrom(normalised));
    else
        StoreShared(m_settings.*RowAt(index).field, Limited(normalised) * RowAt(index).span);
    return true;
}

float Phaser::GetParamPlain(int index) const {
    if (!Has(index)) return 0.0f;
    return index == kStages ? static_cast<float>(LoadShared(m_settings.stages))
                            : LoadShared(m_settings.*RowAt(index).field);
}

float Phaser::GetParam(int index) { return Has(index) ? NormalisedOf(Snapshot(m_settings), index) : 0.0f; }

float Phaser::GetParamFromProp(int index, int preset) {
    if (!Has(index) || !HasPreset(preset)) return -1.0f;
    return NormalisedOf(kPresets[static_cast<std::size_t>(preset)].settings, index);
}

std::wstring Phaser::GetParameterFormattedText(int index, double value) {
    if (!Has(index)) return {};
    const auto normalised = static_cast<float>(value);
    if (index == kStages) {
        // No position of the knob stands for the presets' 0 stages, nor for more than it reaches.
        const auto stored = LoadShared(m_settings.stages);
        const bool beyond = stored < 1 || stored > PhaserImpl::kMaxStages;
        return FormatInteger(beyond && normalised == GetParam(index) ? stored : StagesFrom(normalised));
    }
    const Row& row = RowAt(index);
    return WithUnit(FormatFixed(Limited(normalised) * row.span * row.shown, row.decimals), row.unit);
}

float Phaser::GetParamValueNormalizedFromText(int index, std::string text) {
    if (!Has(index)) return -1.0f;
    const float number = ParseNumber(text);
    if (index == kStages) {
        const auto stages = static_cast<std::int32_t>(std::lround(Limited(number, PhaserImpl::kMaxStages)));
        return Inverse(StagesFrom, stages, (static_cast<float>(stages) - 1.0f) / 29.0f);
    }
    const Row& row = RowAt(index);
    return Limited(static_cast<float>(number / (row.shown * row.span)));
}

void Phaser::GetParamSectionInfo(int index, PluginParameterInfo& info) {
    if (!Has(index)) return;
    info = {};
    info.param_index = index;
    info.label = Narrow(GetParamName(index));
}

void Phaser::InitializeXyEditingData(GenericUIData& data) {
    enum { kRate, kFeedback };
    data.groups = {MakeGroup("Default", 0, {kRate}, {kFeedback})};
    data.entries = {"Default"};
}

std::string Phaser::GetPresetName(int preset) {
    return HasPreset(preset) ? kPresets[static_cast<std::size_t>(preset)].name : std::string();
}

void Phaser::SetPreset(int preset) {
    if (!HasPreset(preset)) return;
    Assign(m_settings, kPresets[static_cast<std::size_t>(preset)].settings);
    m_cook.store(true, std::memory_order_release);
}

void Phaser::GetSettingsChunk(std::vector<std::uint8_t>& chunk) {
    SettingsChunk::Write(chunk, kChunkVersion, m_settings);
}

void Phaser::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    std::int32_t version;
    if (SettingsChunk::Read(chunk, version, m_settings)) m_cook.store(true, std::memory_order_release);
}

void Phaser::Cleanup() {
    for (auto& engine : m_engines) engine->Clear();
}

void Phaser::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const bool changed =
        format->nChannels != m_format.nChannels || format->nSamplesPerSec != m_format.nSamplesPerSec;
    m_format = *format;
    if (m_cook.exchange(false, std::memory_order_acquire) || force || changed)
        InitState(Snapshot(m_settings));
}

void Phaser::InitState(const PhaserSettings& settings) {
    InitEnvelopes(true);
    const auto used = [&](float PhaserSettings::*field, float limit = 1.0f) {
        return Limited(settings.*field, limit);
    };
    const double hz = std::max<std::uint32_t>(m_format.nSamplesPerSec, 1), nyquist = hz * 0.5;
    constexpr float kHighestHz = 10000.0f;
    const float wet = used(&PhaserSettings::wet), width = used(&PhaserSettings::width);
    // Full level on both sides of the middle: the mix fades one out, never both.
    const double level = 1.0 - static_cast<float>(2.0 * std::abs(wet - 0.5)) + 1.0;
    for (auto& engine : m_engines) {
        engine->oscillator.SetIncrement(used(&PhaserSettings::rate) * kRateHz / hz * PhaserImpl::kCycle);
        engine->wet = level * wet;
        engine->dry = level * (1.0 - wet);
        engine->feedback = used(&PhaserSettings::feedback);
        engine->minimum = used(&PhaserSettings::minimum, kHighestHz) / nyquist;
        engine->maximum = used(&PhaserSettings::maximum, kHighestHz) / nyquist;
        engine->stages = std::clamp(settings.stages, 0, PhaserImpl::kMaxStages);
        // A stage that joins later starts silent.
        std::fill(engine->memories.begin() + engine->stages, engine->memories.end(), 0.0);
    }
    const int channels = m_format.nChannels;
    if (width == m_cooked_width && channels == m_cooked_channels) return;
    m_cooked_width = width;
    m_cooked_channels = channels;
    m_engines[1]->oscillator.SetPhase(m_engines[0]->oscillator.Phase() + width * SineOscillator::kTwoPi);
}

void Phaser::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    const int channels = format->nChannels;
    if (frames < 1 || channels < 1) return;
    WithSamples(buffer, *format, OtherWidths::AreFloat, [&]<typename Sample>(Sample* samples) {
        PhaserKernel::Run<Sample>({m_engines[0].get(), m_engines[1].get()}, {samples, samples + 1},
                                  std::min(channels, MaxNumChannels), frames, channels);
    });
}

void Phaser::ProcessInternalNoninterleaved(double* const* channels, int frames, const tWAVEFORMATEX* format,
                                           ProcessFlags&) {
    CheckCookProperties(format, false);
    const int count = std::min<int>(format->nChannels, MaxNumChannels);
    if (frames < 1 || count < 1) return;
    WithChannels(channels, *format, OtherWidths::AreFloat, [&]<typename Sample>(Sample* const* buffers) {
        PhaserKernel::Run<Sample>({m_engines[0].get(), m_engines[1].get()},
                                  {buffers[0], count == 2 ? buffers[1] : nullptr}, count, frames, 1);
    });
}

}  // namespace Corvo::DSP

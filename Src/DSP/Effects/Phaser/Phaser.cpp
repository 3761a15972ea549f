#include "DSP/Effects/Phaser/Phaser.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "DSP/Effects/Parameters/EffectTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Effects/Phaser/PhaserImpl.h"
#include "DSP/Effects/Phaser/PhaserKernel.h"
#include "DSP/Effects/Phaser/PhaserPresets.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

std::int32_t StagesFrom(float normalised) {
    return 1 - static_cast<std::int32_t>(Limited(normalised) * -29.0f);
}

float NormalisedFromStages(std::int32_t stages) {
    const auto count = static_cast<float>(stages);
    return Inverse([](float n, float) { return static_cast<float>(StagesFrom(n)); }, 1.0f, count,
                   (count - 1.0f) / 29.0f);
}

constexpr Storage kStageCount{
    [](const Storage&, float n) { return static_cast<std::uint32_t>(StagesFrom(n)); }, PlainOfInteger,
    [](const Storage&, std::uint32_t word) { return NormalisedFromStages(static_cast<std::int32_t>(word)); }};

constexpr Shown kStagesShown{
    [](const ParameterRow&, double n) { return FormatInteger(StagesFrom(static_cast<float>(n))); },
    [](const ParameterRow&, const std::string& text) {
        const float stages = Limited(ParseNumber(text), PhaserImpl::kMaxStages);
        return NormalisedFromStages(static_cast<std::int32_t>(std::lround(stages)));
    }};

using S = PhaserSettings;
// clang-format off
constexpr std::array<ParameterRow, 7> kRows{{
    // label               unit   type       kept as             shown as            word of the settings
    {L"Rate",              L"Hz", MPT_FLOAT, RealWord(1.0f),     Scaled(6.0, 2),     WordAt(&S::rate)},
    {L"Feedback",          L"%",  MPT_FLOAT, RealWord(1.0f),     Scaled(100.0, 0),   WordAt(&S::feedback)},
    {L"Wet",               L"%",  MPT_FLOAT, RealWord(1.0f),     Scaled(100.0, 0),   WordAt(&S::wet)},
    {L"Minimum frequency", L"Hz", MPT_FLOAT, RealWord(10000.0f), Scaled(1.0, 0),     WordAt(&S::minimum)},
    {L"Maximum frequency", L"Hz", MPT_FLOAT, RealWord(10000.0f), Scaled(1.0, 0),     WordAt(&S::maximum)},
    {L"Stereo width",      L"%",  MPT_FLOAT, RealWord(1.0f),     Scaled(100.0, 0),   WordAt(&S::width)},
    {L"Stages",            L"",   MPT_FLOAT, kStageCount,        kStagesShown,       WordAt(&S::stages)},
}};
// clang-format on
constexpr int kStages = 6;
constexpr double kRateHz = 6.0;

const EffectTable& Table() {
    static const EffectTable table{
        .name = "Phaser",
        .image = "builtinPhaser.png",
        .icon = "BuiltinPlugins/Phaser@3x.png",
        .rows = kRows,
        .chunk = {.words = kWordsOf<PhaserSettings>},
        .presets = PresetsOf(PhaserPresets::kPresets),
        .pads = {{"Default", {0}, {1}}},
        .inputGuard = InputGuard::EveryFormat,
    };
    return table;
}

}  // namespace

Phaser::Phaser() : CorvoEffectBase(Table(), &m_settings) {
    for (auto& engine : m_engines) engine = std::make_shared<PhaserImpl>();
    SetPreset(0);
}
Phaser::~Phaser() = default;

bool Phaser::HasSeparateLeftRightSettings() { return false; }
bool Phaser::SupportsNoninterleaved() { return true; }
bool Phaser::DoSetParam(int index, float normalised, bool fromAutomation) {
    return CorvoEffectBase::DoSetParam(index, normalised, fromAutomation);
}
float Phaser::GetParam(int index) { return CorvoEffectBase::GetParam(index); }
int Phaser::GetParamCountReal() { return CorvoEffectBase::GetParamCountReal(); }
std::string Phaser::GetName() { return CorvoEffectBase::GetName(); }

std::wstring Phaser::GetParameterFormattedText(int index, double value) {
    // No position of the knob stands for the presets' 0 stages, nor for more than it reaches.
    const auto stored = LoadShared(m_settings.stages);
    const bool beyond = stored < 1 || stored > PhaserImpl::kMaxStages;
    if (index == kStages && beyond && static_cast<float>(value) == GetParam(index))
        return FormatInteger(stored);
    return CorvoEffectBase::GetParameterFormattedText(index, value);
}

void Phaser::Cleanup() {
    for (auto& engine : m_engines) engine->Clear();
}

void Phaser::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    if (TakeCook(m_format, *format, force).due) InitState(Snapshot(m_settings));
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

#include "DSP/Effects/Compressor/Compressor.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <mutex>

#include "DSP/Effects/Compressor/CompressorPresets.h"
#include "DSP/Effects/Compressor/CompressorSides.h"
#include "DSP/Effects/Parameters/EffectTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "Platform/Assertion.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {

using namespace CompressorPrivate;

namespace {

// Parameters come as pairs of this order.
enum Pair { kAttack, kRelease, kOutGain, kThreshold, kRatio, kStereoLink, kMakeUp, kMonitor };

constexpr int kDefaultPreset = 1;
constexpr double kHighestRatioShown = 100.0;
constexpr double kSameSlope = 0.01 / kRatioSteps;

Pair PairOf(int index) { return static_cast<Pair>(index / 2); }
bool IsOfTheCurve(int index) { return PairOf(index) == kThreshold || PairOf(index) == kRatio; }
std::size_t SideOf(int index) { return static_cast<std::size_t>(index % 2); }

std::int32_t Tenths(double db) { return static_cast<std::int32_t>(std::lround(db * 10.0)); }
std::int32_t Hundredths(double ms) { return static_cast<std::int32_t>(std::lround(ms * 100.0)); }

// The ratio of a slope as it is shown: cut to tenths, infinite beyond what can be shown.
double RatioShown(double slope) {
    // Ratios are read from points in single precision; a hundredth of the last digit makes up for that.
    constexpr double kTolerance = 0.01;
    const double ratio = 1.0 / slope;
    if (!(std::abs(ratio) <= kHighestRatioShown)) return std::numeric_limits<double>::infinity();
    return std::trunc(ratio * 10.0 + std::copysign(kTolerance, ratio)) / 10.0;
}

std::wstring RatioText(const TransferCurve& curve) {
    const double ratio = RatioShown(curve.SlopeAboveThreshold());
    return std::isinf(ratio) ? L"Inf.:1" : FormatFixed(ratio, 1) + L":1";
}

// The lowest step whose text is this ratio, rounded to tenths.
std::int32_t LowestRatioStep(double ratio) {
    if (!(ratio > 1.0)) return 0;
    if (ratio > kHighestRatioShown) return kRatioSteps;
    const double step = kRatioSteps - 10.0 * kRatioSteps / std::round(ratio * 10.0);
    return static_cast<std::int32_t>(std::ceil(step - 1e-6));
}

// The step that drew the curve; for any other curve the lowest one that shows its text. One that falls counts
// as flat.
std::int32_t RatioStepOf(const TransferCurve& curve) {
    const double slope = curve.SlopeAboveThreshold(), ratio = RatioShown(slope);
    if (ratio < 0.0) return kRatioSteps;
    const auto nearest =
        static_cast<std::int32_t>(std::lround((1.0 - std::clamp(slope, 0.0, 1.0)) * kRatioSteps));
    const bool drawn =
        std::abs(slope - SlopeOfStep(nearest)) < kSameSlope && RatioShown(SlopeOfStep(nearest)) == ratio;
    return drawn ? nearest : LowestRatioStep(ratio);
}

// Where the threshold's control stands.
std::int32_t ThresholdOf(const TransferCurve& curve) {
    return std::clamp(curve.ThresholdTenths(), kLowestThreshold, kHighestThreshold);
}

std::wstring TimeText(const ParameterRow& row, double normalised) {
    constexpr int kWidth = 4;
    const auto hundredths = row.storage.map.Word(static_cast<float>(normalised));
    return WithUnit(FormatFixed(hundredths * row.shown.step, row.shown.decimals, kWidth), row.unit);
}

float ReadTime(const ParameterRow& row, const std::string& text) {
    const float ms = Limited(ParseNumber(text), kLongestTime * 0.01f);
    return row.storage.map.Normalised(Hundredths(ms));
}

constexpr Shown Milliseconds(int decimals) { return {TimeText, ReadTime, 0.01, decimals}; }
// Threshold and ratio are shown as they stand in the curve, by the effect.
constexpr Shown kRatioShown{nullptr, [](const ParameterRow& row, const std::string& text) {
                                return row.storage.map.Normalised(LowestRatioStep(ParseNumber(text)));
                            }};

// Both sides of a switch are one word.
using P = Compressor::Parameters;
// clang-format off
constexpr std::array<ParameterRow, 16> kRows{{
    // label                 unit   type       kept as              shown as                       word of the parameters
    {L"Attack L",            L"ms", MPT_FLOAT, {99999.0f,    1.0f}, Milliseconds(2),  WordAt(&P::attack, 0)},
    {L"Attack R",            L"ms", MPT_FLOAT, {99999.0f,    1.0f}, Milliseconds(2),  WordAt(&P::attack, 1)},
    {L"Release L",           L"ms", MPT_FLOAT, {99999.0f,    1.0f}, Milliseconds(1),  WordAt(&P::release, 0)},
    {L"Release R",           L"ms", MPT_FLOAT, {99999.0f,    1.0f}, Milliseconds(1),  WordAt(&P::release, 1)},
    {L"Out gain L",          L"dB", MPT_FLOAT, { 1160.0f, -960.0f}, TenthsOfDb(kSilentOutGain),  WordAt(&P::outGain, 0)},
    {L"Out gain R",          L"dB", MPT_FLOAT, { 1160.0f, -960.0f}, TenthsOfDb(kSilentOutGain),  WordAt(&P::outGain, 1)},
    {L"Threshold L",         L"dB", MPT_FLOAT, {  790.0f, -800.0f}, TenthsOfDb(kLowestThreshold)},
    {L"Threshold R",         L"dB", MPT_FLOAT, {  790.0f, -800.0f}, TenthsOfDb(kLowestThreshold)},
    {L"Ratio L",             L"",   MPT_FLOAT, {  251.0f,    0.0f}, kRatioShown},
    {L"Ratio R",             L"",   MPT_FLOAT, {  251.0f,    0.0f}, kRatioShown},
    {L"Stereo Link",         L"",   MPT_BOOL,  SwitchWord(),        OnOff(),  WordAt(&P::stereoLink)},
    {L"Stereo Link",         L"",   MPT_BOOL,  SwitchWord(),        OnOff(),  WordAt(&P::stereoLink)},
    {L"Auto Make-up Gain",   L"",   MPT_BOOL,  SwitchWord(),        OnOff(),  WordAt(&P::makeUp)},
    {L"Auto Make-up Gain",   L"",   MPT_BOOL,  SwitchWord(),        OnOff(),  WordAt(&P::makeUp)},
    {L"Monitor sidechain L", L"",   MPT_BOOL,  SwitchWord(),        OnOff(),  WordAt(&P::flags)},
    {L"Monitor sidechain R", L"",   MPT_BOOL,  SwitchWord(),        OnOff(),  WordAt(&P::flags)},
}};
// clang-format on

const EffectTable& Table() {
    static const EffectTable table = [] {
        EffectTable made{.name = "Compressor",
                         .rows = kRows,
                         .chunk = {},
                         .defaultPreset = kDefaultPreset,
                         .sectionLabel = SectionLabel::None};
        for (const auto& preset : kCompressorPresets) made.presets.push_back({preset.name, {}});
        return made;
    }();
    return table;
}

AnyWord& WordOf(Compressor::Parameters& parameters, const ParameterRow& row) {
    return reinterpret_cast<AnyWord*>(&parameters)[row.word];
}

}  // namespace

Compressor::Compressor()
    : CorvoEffect(Table(), nullptr),
      m_ui(std::make_unique_for_overwrite<UserInterfaceSide>()),
      m_audio(std::make_unique_for_overwrite<AudioSide>()),
      m_hand_over(std::make_unique_for_overwrite<HandOver>()) {
    m_ui->preset = kDefaultPreset;
    m_ui->edited.submission = 0;
    m_ui->edited = GetPresetData(kDefaultPreset);
    m_audio->current = m_ui->edited;
}

Compressor::~Compressor() = default;

bool Compressor::HasNativeEditor() { return true; }
void Compressor::Cleanup() {}
int Compressor::GetNumSidechainBusses() { return 1; }
int Compressor::GetSidechainBusNumChannelsMax(int) { return 2; }
bool Compressor::IsUsingSideChain() const { return m_hand_over->usingSideChain; }
void Compressor::SetGainMeterOn(bool on) { m_hand_over->meterOn = on; }
bool Compressor::IsGainMeterOn() const { return m_hand_over->meterOn; }

double Compressor::GetGainReduction(int channel) const {
    return channel == 0 || channel == 1 ? m_hand_over->displayGain[static_cast<std::size_t>(channel)].load()
                                        : 1.0f;
}

EditChannelMode Compressor::GetEditChannelMode() const {
    const std::lock_guard lock(m_ui->section);
    return m_ui->editChannelMode;
}

void Compressor::SetEditChannelMode(EditChannelMode mode) {
    const std::lock_guard lock(m_ui->section);
    m_ui->editChannelMode = mode;
}

void Compressor::SetParam(int index, float normalised, bool fromAutomation) {
    const int real = m_reverse_param_order ? GetParamCountReal() - index - 1 : index;
    if (DoSetParam(real, normalised, fromAutomation && !m_reverse_param_order)) MarkStale();
}

bool Compressor::DoSetParam(int index, float normalised, bool fromAutomation) {
    if (!RealRow(index)) return false;
    if (!fromAutomation) {
        SetParamFromUi(index, normalised, true);
        return true;
    }
    TakeUiSettings();
    auto& current = m_audio->current;
    if (!IsOfTheCurve(index)) {
        SetParamInternal(index, normalised, current.parameters, nullptr);
        return true;
    }
    auto map = current.curves.Map();
    SetParamInternal(index, normalised, current.parameters, &map);
    current.curves = map;
    *m_hand_over->toUserInterface.Draft() = current;
    m_hand_over->toUserInterface.Publish();
    return true;
}

void Compressor::SetParamFromUi(int index, float normalised, bool submit) {
    const std::lock_guard lock(m_ui->section);
    ApplyEnvelopeToUi();
    SetParamInternal(index, normalised, m_ui->edited.parameters, nullptr);
    if (submit)
        SubmitUiSettingsChange();
    else
        ++m_ui->edited.submission;  // curves that come back from the audio side do not know this edit
}

void Compressor::SetParamInternal(int index, float normalised, Parameters& parameters, CompMapStereo* map) {
    const ParameterRow* const row = RealRow(index);
    if (!row) return;
    const auto word = row->storage.store(row->storage, normalised);
    if (PairOf(index) == kThreshold) {
        EditCurves(map, [&](CompMapStereo& curves) {
            curves.last_threshold = static_cast<std::int32_t>(word);
            AdjustThreshold(curves.last_threshold, SideOf(index), &curves);
            ApplyRatioToMap(&curves);
        });
    } else if (PairOf(index) == kRatio) {
        EditCurves(map, [&](CompMapStereo& curves) {
            curves.last_ratio_step = static_cast<std::int32_t>(word);
            AdjustRatio(curves.last_ratio_step, SideOf(index), &curves);
        });
    } else if (PairOf(index) == kMonitor) {
        parameters.flags = (parameters.flags & ~kMonitorFlag) | static_cast<std::int32_t>(word);
    } else {
        WordOf(parameters, *row) = word;
    }
}

template <typename Edit>
void Compressor::EditCurves(CompMapStereo* map, Edit edit) {
    if (map) return edit(*map);
    auto own = m_ui->edited.curves.Map();
    edit(own);
    m_ui->edited.curves = own;
}

// A threshold or ratio that the curve shows already leaves it alone: no control is as fine as a curve.
void Compressor::AdjustThreshold(std::int32_t tenths, std::size_t channel, CompMapStereo* map) {
    if (channel >= MaxNumChannels) return;
    tenths = std::clamp(tenths, kLowestThreshold, kHighestThreshold);
    EditCurves(map, [&](CompMapStereo& curves) {
        auto& curve = curves.m_comp_map[channel];
        if (tenths != ThresholdOf(curve)) curve.MoveThreshold(tenths);
    });
}

void Compressor::AdjustRatio(std::int32_t step, std::size_t channel, CompMapStereo* map) {
    if (channel >= MaxNumChannels) return;
    step = std::clamp(step, 0, kRatioSteps);
    EditCurves(map, [&](CompMapStereo& curves) {
        auto& curve = curves.m_comp_map[channel];
        if (step != RatioStepOf(curve)) curve.SetRatioStep(step);
    });
}

void Compressor::ApplyRatioToMap(CompMapStereo* map) {
    EditCurves(map, [&](CompMapStereo& curves) {
        const auto step = curves.last_ratio_step;
        if (step == kNotSet) return;
        for (std::size_t channel = 0; channel < 2; ++channel)
            if (std::abs(curves.m_comp_map[channel].SlopeAboveThreshold() - SlopeOfStep(step)) < kSameSlope)
                AdjustRatio(step, channel, &curves);
    });
}

float Compressor::GetParam(int index) {
    const ParameterRow* const row = RealRow(index);
    if (!row) return 0.0f;
    const std::lock_guard lock(m_ui->section);
    ApplyEnvelopeToUi();
    if (IsOfTheCurve(index)) {
        const auto curve = m_ui->edited.curves.Map().m_comp_map[SideOf(index)];
        return row->storage.map.Normalised(PairOf(index) == kRatio ? RatioStepOf(curve) : ThresholdOf(curve));
    }
    const auto word = WordOf(m_ui->edited.parameters, *row);
    return row->storage.normalised(row->storage, PairOf(index) == kMonitor ? word & kMonitorFlag : word);
}

std::wstring Compressor::GetParameterFormattedText(int index, double value) {
    if (!RealRow(index) || !IsOfTheCurve(index)) return CorvoEffect::GetParameterFormattedText(index, value);
    const std::lock_guard lock(m_ui->section);
    ApplyEnvelopeToUi();
    const TransferCurve curve = m_ui->edited.curves.Map().m_comp_map[SideOf(index)];
    if (curve.Threshold() == curve.end())
        ReportAssertion("Src/DSP/Effects/Compressor", "itThreshold!=m_comp_map[canale].end()");
    return WithUnit(PairOf(index) == kRatio ? RatioText(curve)
                                            : FormatTenthsOfDb(curve.ThresholdTenths(), kLowestThreshold),
                    kRows[static_cast<std::size_t>(index)].unit);
}

Compressor::Settings Compressor::GetPresetData(int preset) {
    const auto last = static_cast<int>(kCompressorPresets.size()) - 1;
    const auto& row = kCompressorPresets[static_cast<std::size_t>(std::clamp(preset, 0, last))];
    Settings settings;
    settings.parameters.attack.fill(Hundredths(row.attack));
    settings.parameters.release.fill(Hundredths(row.release));
    settings.parameters.outGain.fill(Tenths(row.outGain));
    settings.parameters.stereoLink = row.stereoLink;
    settings.parameters.makeUp = row.autoMakeUp;
    settings.map.m_comp_map.fill(DrawCurve(row));
    return settings;
}

void Compressor::SetPreset(int preset) {
    if (preset < 0 || preset >= NumPresets()) return;
    const std::lock_guard lock(m_ui->section);
    ApplyEnvelopeToUi();
    m_ui->preset = preset;
    m_ui->edited = GetPresetData(preset);  // forgets the last threshold and ratio
    SubmitUiSettingsChange();
}

void Compressor::SubmitUiSettingsChange() {
    const std::lock_guard lock(m_ui->section);
    ++m_ui->edited.submission;
    *m_hand_over->toAudio.Draft() = m_ui->edited;
    m_hand_over->toAudio.Publish();
    MarkStale();
}

void Compressor::ApplyEnvelopeToUi() {
    const std::lock_guard lock(m_ui->section);
    // Curves that derive from settings submitted before the last ones are out of date.
    const auto* changed = m_hand_over->toUserInterface.Take();
    if (changed && (*changed)->submission == m_ui->edited.submission)
        m_ui->edited.curves = (*changed)->curves;
}

}  // namespace Corvo::DSP

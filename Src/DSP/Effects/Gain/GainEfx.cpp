#include "DSP/Effects/Gain/GainEfx.h"

#include <cmath>
#include <numbers>

#include "DSP/Effects/Gain/GainKernel.h"
#include "DSP/Effects/Parameters/ParameterTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Effects/Parameters/SettingsChunk.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP::GainEfx {
namespace {

enum Index : std::size_t { kGain, kWidth, kPan, kFlipLeft, kFlipRight, kCount };

struct Row {
    const wchar_t *label, *unit;
    MP_TYPE type;
    float minimum, maximum, neutral, fallback;
    bool stereoOnly;
    int stereoGroup;
};

// clang-format off
constexpr std::array<Row, kCount> kRows{{
    // label          unit   type      min      max    neutral default  stereo only, group
    {L"Gain",         L"dB", MPT_INT,  0.0001f, 10.0f, 1.0f,   1.0f,    false, 1},
    {L"Stereo width", L"",   MPT_INT,  0.0f,     2.0f, 1.0f,   1.0f,    true,  0},
    {L"Pan",          L"",   MPT_INT, -1.0f,     1.0f, 0.0f,   0.0f,    true,  0},
    {L"Flip phase L", L"",   MPT_BOOL, 0.0f,     1.0f, 0.0f,   0.0f,    false, 2},
    {L"Flip phase R", L"",   MPT_BOOL, 0.0f,     1.0f, 0.0f,   0.0f,    true,  2},
}};
// clang-format on

constexpr int kChunkSize = kCount * sizeof(float);
constexpr std::int32_t kSilentTenths = -800;
// +3 dB makes up for the constant-power law's loss; not the square root of two.
constexpr double kPanMakeUp = 1.4125375446227544;

bool Has(int index) { return index >= 0 && index < static_cast<int>(kCount); }

float Limited(float normalised) { return normalised > 0.0f ? (normalised < 1.0f ? normalised : 1.0f) : 0.0f; }

// "Gain" is linear in amplitude on each half of the knob, so that its middle is exactly unity.
float GainPlain(const Row& row, float n) {
    return n > 0.5f ? 1.0f + (row.maximum - 1.0f) * (n - 0.5f) / 0.5f
                    : row.minimum + (1.0f - row.minimum) * n / 0.5f;
}

float GainNormalised(const Row& row, float plain) {
    return plain > 1.0f ? 0.5f + 0.5f * (plain - 1.0f) / (row.maximum - 1.0f)
                        : 0.5f * (plain - row.minimum) / (1.0f - row.minimum);
}

float Plain(std::size_t index, float n) {
    const Row& row = kRows[index];
    return index == kGain ? GainPlain(row, n) : row.minimum + (row.maximum - row.minimum) * n;
}

float Normalised(std::size_t index, float plain) {
    const Row& row = kRows[index];
    return Limited(index == kGain ? GainNormalised(row, plain)
                                  : (plain - row.minimum) / (row.maximum - row.minimum));
}

std::wstring GainText(float plain) {
    const double tenths = std::log10(static_cast<double>(plain)) * 200.0;
    // Text of NaN and of anything at or below the floor; the cast would be undefined.
    if (!(tenths > kSilentTenths - 1)) return FormatTenthsOfDb(kSilentTenths, kSilentTenths);
    return FormatTenthsOfDb(static_cast<std::int32_t>(std::min(tenths, 1e6)), kSilentTenths);
}

// The pan law's factors. Centre and ends are pinned: the law itself would miss unity at the centre.
double PanLeft(double pan) {
    if (pan == 0.0) return 1.0;
    if (pan == 1.0) return 0.0;
    if (pan == -1.0) return kPanMakeUp;
    return kPanMakeUp * std::cos((pan + 1.0) * (std::numbers::pi / 4.0));
}

double PanRight(double pan) {
    if (pan == 0.0) return 1.0;
    if (pan == 1.0) return kPanMakeUp;
    if (pan == -1.0) return 0.0;
    return kPanMakeUp * std::sin((pan + 1.0) * (std::numbers::pi / 4.0));
}

}  // namespace

GainEfx::GainEfx() { InitializeParamsFromDefault(); }
GainEfx::~GainEfx() = default;

void GainEfx::InitializeParamsFromDefault() {
    for (std::size_t i = 0; i < kCount; ++i) {
        StoreShared(m_params[i], kRows[i].fallback);
        m_knobs[i] = {};
        m_knobs[i].param_index = m_knobs[i].layout_group = static_cast<int>(i);
        m_knobs[i].is_switch = kRows[i].type == MPT_BOOL;
    }
    m_mono_layout.store(true, std::memory_order_relaxed);
    m_coef_dirty.store(true, std::memory_order_release);
}

void GainEfx::SetKnobsLayout(bool mono, std::array<PluginParameterInfo, 5>& knobs) {
    knobs[kFlipLeft].label = mono ? "Flip phase" : "Flip phase L";
    if (!mono) knobs[kFlipRight].label = "Flip phase R";
    for (std::size_t i = 0; i < kCount; ++i) knobs[i].layout_group = mono ? -1 : kRows[i].stereoGroup;
}

bool GainEfx::HasSeparateLeftRightSettings() { return m_separate_settings; }
bool GainEfx::SupportsNoninterleaved() { return true; }
int GainEfx::GetSettingsChunkSize() { return kChunkSize; }
int GainEfx::GetParamCountReal() { return kCount; }
std::string GainEfx::GetName() { return "Gain"; }

const MP_PARAMINFO* GainEfx::GetParametersInfo() {
    static const auto records = [] {
        std::array<MP_PARAMINFO, kCount> table;
        std::ranges::transform(kRows, table.begin(), [](const Row& row) {
            return MakeParamInfo(row.label, row.unit, row.type, 0, row.minimum, row.maximum, row.neutral);
        });
        return table;
    }();
    return records.data();
}

bool GainEfx::DoSetParam(int index, float normalised, bool) {
    if (!Has(index)) return false;
    const auto parameter = static_cast<std::size_t>(index);
    StoreShared(m_params[parameter], Plain(parameter, normalised));
    m_coef_dirty.store(true, std::memory_order_release);
    return true;
}

float GainEfx::GetParam(int index) {
    return Has(index) ? Normalised(static_cast<std::size_t>(index), GetParamPlain(index)) : 0.0f;
}

float GainEfx::GetParamPlain(int index) const {
    return Has(index) ? LoadShared(m_params[static_cast<std::size_t>(index)]) : 0.0f;
}

std::wstring GainEfx::GetParameterFormattedText(int index, double value) {
    if (!Has(index)) return {};
    const Row& row = kRows[static_cast<std::size_t>(index)];
    if (row.type == MPT_BOOL) return FormatSwitch(value >= 0.5);
    const float plain = GetParamPlain(index);
    return WithUnit(index == kGain ? GainText(plain) : FormatFixed(plain, 2), row.unit);
}

float GainEfx::GetParamValueNormalizedFromText(int index, std::string text) {
    if (!Has(index)) return -1.0f;
    const auto parameter = static_cast<std::size_t>(index);
    const float number = ParseNumber(text);
    return Normalised(parameter, index == kGain ? static_cast<float>(std::pow(10.0, number * 0.05)) : number);
}

void GainEfx::GetParamSectionInfo(int index, PluginParameterInfo& info) {
    if (!Has(index)) return;
    const auto parameter = static_cast<std::size_t>(index);
    auto knobs = m_knobs;
    if (m_had_stereo.load(std::memory_order_relaxed)) SetKnobsLayout(false, knobs);  // a label that stays
    SetKnobsLayout(m_mono_layout.load(std::memory_order_relaxed), knobs);
    info = knobs[parameter];
    info.hidden = kRows[parameter].stereoOnly && m_stereo_hidden.load(std::memory_order_relaxed);
}

void GainEfx::GetSettingsChunk(std::vector<std::uint8_t>& chunk) {
    ChunkWriter(chunk, kChunkSize)(Snapshot(m_params));
}

void GainEfx::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    std::array<float, kCount> params;
    if (!ChunkReader(chunk)(params)) return;
    Assign(m_params, params);
    m_layout_dirty.store(true, std::memory_order_release);
    m_coef_dirty.store(true, std::memory_order_release);
}

void GainEfx::CheckCookProperties(const tWAVEFORMATEX* format, bool) {
    const bool wasMono = m_format.nChannels != 2;
    m_format = *format;
    const bool mono = m_format.nChannels != 2;
    m_stereo_hidden.store(mono, std::memory_order_relaxed);
    if (!m_layout_dirty.exchange(false, std::memory_order_acquire) && mono == wasMono) return;
    if (!mono) m_had_stereo.store(true, std::memory_order_relaxed);
    m_mono_layout.store(mono, std::memory_order_relaxed);
    SetUpdateUiFromScratch(true);
}

void GainEfx::UpdateCoefficients() {
    if (!m_coef_dirty.exchange(false, std::memory_order_acquire)) return;
    const auto params = Snapshot(m_params);
    // Above 1 the width grows twice as fast, up to 4.
    m_coef_side = params[kWidth] > 1.0f ? 2.0f * params[kWidth] : params[kWidth];
    m_coef_mid = std::max(2.0f - m_coef_side, 1.0f);
    const auto gain = [&](Index flip) { return params[flip] != 0.0f ? -params[kGain] : params[kGain]; };
    m_gain_left = static_cast<float>(gain(kFlipLeft) * PanLeft(params[kPan]));
    m_gain_right = static_cast<float>(gain(kFlipRight) * PanRight(params[kPan]));
}

void GainEfx::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags& flags) {
    CheckCookProperties(format, flags.force_cook);
    UpdateCoefficients();
    if (frames < 1) return;
    WithSamples(buffer, *format, OtherWidths::Skip, [&]<typename Sample>(Sample* samples) {
        const Coefficients<Sample> c{m_coef_side, m_coef_mid, m_gain_left, m_gain_right};
        const int channels = format->nChannels;
        if (channels == 2)
            ScaleStereo(samples, frames, c);
        else if (channels > 0)
            for (int i = 0; i < frames; ++i) samples[static_cast<std::ptrdiff_t>(i) * channels] *= c.left;
    });
}

void GainEfx::ProcessInternalNoninterleaved(double* const* channels, int frames, const tWAVEFORMATEX* format,
                                            ProcessFlags& flags) {
    CheckCookProperties(format, flags.force_cook);
    UpdateCoefficients();
    if (frames < 1) return;
    WithChannels(channels, *format, OtherWidths::Skip, [&]<typename Sample>(Sample* const* buffers) {
        const Coefficients<Sample> c{m_coef_side, m_coef_mid, m_gain_left, m_gain_right};
        if (format->nChannels == 2)
            ScaleStereoPlanar(buffers[0], buffers[1], frames, c);
        else if (format->nChannels > 0)
            for (Sample* sample = buffers[0]; sample != buffers[0] + frames; ++sample) *sample *= c.left;
    });
}

}  // namespace Corvo::DSP::GainEfx

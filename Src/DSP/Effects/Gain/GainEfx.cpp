#include "DSP/Effects/Gain/GainEfx.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <numbers>

#include "DSP/Effects/Gain/GainKernel.h"
#include "DSP/Effects/Parameters/EffectTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Platform/Processor.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP::GainEfx {
namespace {

enum Index : std::size_t { kGain, kWidth, kPan, kFlipLeft, kFlipRight, kCount };

constexpr std::int32_t kSilentTenths = -800;
// +3 dB makes up for the constant-power law's loss; not the square root of two.
constexpr double kPanMakeUp = 1.4125375446227544;

constexpr PlainRange kGainRange{0.0001f, 10.0f, 1.0f}, kWidthRange{0.0f, 2.0f, 1.0f},
    kPanRange{-1.0f, 1.0f, 0.0f}, kFlipRange{0.0f, 1.0f, 0.0f};

template <typename Sample>
const Kernels<Sample>& BestKernels() {
    return HasAvx2() ? Avx2Kernels<Sample>() : BaselineKernels<Sample>();
}

// Linear over the range; what lies beyond the knob's ends is stored as it comes.
template <const PlainRange& kRange>
constexpr Storage Linear() {
    return {[](const Storage&, float n) {
                return std::bit_cast<std::uint32_t>(kRange.minimum + (kRange.maximum - kRange.minimum) * n);
            },
            PlainOfReal,
            [](const Storage&, std::uint32_t word) {
                return Limited((PlainOfReal(word) - kRange.minimum) / (kRange.maximum - kRange.minimum));
            }};
}

// "Gain" is linear in amplitude on each half of the knob, so that its middle is exactly unity.
float GainPlain(float n) {
    const auto& [minimum, maximum, unity] = kGainRange;
    return n > 0.5f ? 1.0f + (maximum - 1.0f) * (n - 0.5f) / 0.5f : minimum + (1.0f - minimum) * n / 0.5f;
}

float GainNormalised(float plain) {
    const auto& [minimum, maximum, unity] = kGainRange;
    return Limited(plain > 1.0f ? 0.5f + 0.5f * (plain - 1.0f) / (maximum - 1.0f)
                                : 0.5f * (plain - minimum) / (1.0f - minimum));
}

constexpr Storage kGainHalves{
    [](const Storage&, float n) { return std::bit_cast<std::uint32_t>(GainPlain(n)); }, PlainOfReal,
    [](const Storage&, std::uint32_t word) { return GainNormalised(PlainOfReal(word)); }};

// As shown: cut towards 0 dB.
std::int32_t GainTenths(double tenths) {
    // NaN and anything at or below the floor; the cast would be undefined.
    if (!(tenths > kSilentTenths - 1)) return kSilentTenths;
    return static_cast<std::int32_t>(std::min(tenths, 1e6));
}
std::int32_t GainTenthsOf(float plain) { return GainTenths(std::log10(static_cast<double>(plain)) * 200.0); }

// A tenth of a decibel lies on the edge of what shows it, so that rounding may lead to its neighbour: then
// the next position that shows it, away from 0 dB.
float GainPosition(double db) {
    const double tenths = db * 10.0;
    const std::int32_t wanted = GainTenths(tenths + std::copysign(1e-4, tenths));  // `db` is rounded as well
    float n = GainNormalised(static_cast<float>(std::pow(10.0, db * 0.05)));
    if (wanted == kSilentTenths) return n;
    const float end = wanted < 0 ? 0.0f : 1.0f;
    while (n != end && std::abs(GainTenthsOf(GainPlain(n))) < std::abs(wanted)) n = std::nextafter(n, end);
    return n;
}

// The texts show what is stored, whatever value the host asks for; GainEfx hands it over.
constexpr Shown kGainShown{
    [](const ParameterRow& row, double plain) {
        return WithUnit(FormatTenthsOfDb(GainTenthsOf(static_cast<float>(plain)), kSilentTenths), row.unit);
    },
    [](const ParameterRow&, const std::string& text) { return GainPosition(ParseNumber(text)); }};

float ReadPlain(const ParameterRow& row, const std::string& text) {
    return row.storage.normalised(row.storage, std::bit_cast<std::uint32_t>(ParseNumber(text)));
}
constexpr Shown kNumberShown{
    [](const ParameterRow& row, double plain) { return WithUnit(FormatFixed(plain, 2), row.unit); },
    ReadPlain};
constexpr Shown kFlipShown{[](const ParameterRow&, double value) { return FormatSwitch(value >= 0.5); },
                           ReadPlain};

// clang-format off
constexpr std::array<ParameterRow, kCount> kRows{{
    // label          unit   type      kept as                shown as      word        group in stereo, range
    {L"Gain",         L"dB", MPT_INT,  kGainHalves,           kGainShown,   kGain,      1, kGainRange},
    {L"Stereo width", L"",   MPT_INT,  Linear<kWidthRange>(), kNumberShown, kWidth,     0, kWidthRange},
    {L"Pan",          L"",   MPT_INT,  Linear<kPanRange>(),   kNumberShown, kPan,       0, kPanRange},
    {L"Flip phase L", L"",   MPT_BOOL, Linear<kFlipRange>(),  kFlipShown,   kFlipLeft,  2, kFlipRange},
    {L"Flip phase R", L"",   MPT_BOOL, Linear<kFlipRange>(),  kFlipShown,   kFlipRight, 2, kFlipRange},
}};
// clang-format on
constexpr bool IsStereoOnly(std::size_t index) { return index != kGain && index != kFlipLeft; }

const EffectTable& Table() {
    static const EffectTable table{
        .name = "Gain",
        .rows = kRows,
        .chunk = {.words = kCount, .leadingWord = false},
        .caps = 0,
        .playsAutomation = false,
        .inputGuard = InputGuard::None,  // nothing is remembered
    };
    return table;
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

GainEfx::GainEfx() : CorvoEffect(Table(), &m_params) { InitializeParamsFromDefault(); }
GainEfx::~GainEfx() = default;

void GainEfx::InitializeParamsFromDefault() {
    for (std::size_t i = 0; i < kCount; ++i) {
        StoreShared(m_params[i], kRows[i].range.neutral);
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
    for (std::size_t i = 0; i < kCount; ++i) knobs[i].layout_group = mono ? -1 : kRows[i].section;
}

bool GainEfx::HasSeparateLeftRightSettings() { return m_separate_settings; }
bool GainEfx::SupportsNoninterleaved() { return true; }

bool GainEfx::DoSetParam(int index, float normalised, bool fromAutomation) {
    const bool stored = CorvoEffect::DoSetParam(index, normalised, fromAutomation);
    if (stored) m_coef_dirty.store(true, std::memory_order_release);
    return stored;
}

std::wstring GainEfx::GetParameterFormattedText(int index, double value) {
    return CorvoEffect::GetParameterFormattedText(
        index, index < static_cast<int>(kFlipLeft) ? GetParamPlain(index) : value);
}

void GainEfx::GetParamSectionInfo(int index, PluginParameterInfo& info) {
    if (!RowOf(index)) return;
    const auto parameter = static_cast<std::size_t>(index);
    auto knobs = m_knobs;
    if (m_had_stereo.load(std::memory_order_relaxed)) SetKnobsLayout(false, knobs);  // a label that stays
    SetKnobsLayout(m_mono_layout.load(std::memory_order_relaxed), knobs);
    info = knobs[parameter];
    info.hidden = IsStereoOnly(parameter) && m_stereo_hidden.load(std::memory_order_relaxed);
}

void GainEfx::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    if (std::int32_t unused; !TakeChunk(chunk, unused)) return;
    m_layout_dirty.store(true, std::memory_order_release);
    m_coef_dirty.store(true, std::memory_order_release);
}

void GainEfx::CheckCookProperties(const tWAVEFORMATEX* format, bool) {
    const bool wasMono = m_format.nChannels != 2;
    m_format = *format;
    const bool mono = m_format.nChannels != 2;
    m_stereo_hidden.store(mono, std::memory_order_relaxed);
    if (!TakeFlag(m_layout_dirty) && mono == wasMono) return;
    if (!mono) m_had_stereo.store(true, std::memory_order_relaxed);
    m_mono_layout.store(mono, std::memory_order_relaxed);
    SetUpdateUiFromScratch(true);
}

void GainEfx::UpdateCoefficients() {
    if (!TakeFlag(m_coef_dirty)) return;
    constexpr float kLargest = std::numeric_limits<float>::max();
    auto params = Snapshot(m_params);
    // A chunk may hold anything, and is kept as it is.
    for (std::size_t i = 0; i < kCount; ++i)
        if (!std::isfinite(params[i])) params[i] = kRows[i].range.neutral;
    // Above 1 the width grows twice as fast, up to 4.
    const float width = std::min(params[kWidth], kLargest / 2.0f);
    m_coef_side = width > 1.0f ? 2.0f * width : width;
    m_coef_mid = std::max(2.0f - m_coef_side, 1.0f);
    const auto gain = [&](Index flip, double pan) {
        const double level = (params[flip] != 0.0f ? -params[kGain] : params[kGain]) * pan;
        return static_cast<float>(std::clamp<double>(level, -kLargest, kLargest));
    };
    m_gain_left = gain(kFlipLeft, PanLeft(params[kPan]));
    m_gain_right = gain(kFlipRight, PanRight(params[kPan]));
}

void GainEfx::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags& flags) {
    CheckCookProperties(format, flags.force_cook);
    UpdateCoefficients();
    if (frames < 1) return;
    WithSamples(buffer, *format, OtherWidths::Skip, [&]<typename Sample>(Sample* samples) {
        const Coefficients<Sample> c{m_coef_side, m_coef_mid, m_gain_left, m_gain_right};
        const int channels = format->nChannels;
        if (channels == 2)
            BestKernels<Sample>().interleaved(samples, frames, c);
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
            BestKernels<Sample>().planar(buffers[0], buffers[1], frames, c);
        else if (format->nChannels > 0)
            for (Sample* sample = buffers[0]; sample != buffers[0] + frames; ++sample) *sample *= c.left;
    });
}

}  // namespace Corvo::DSP::GainEfx

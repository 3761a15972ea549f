#include "DSP/Effects/Reverb/Reverb.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "DSP/Effects/Parameters/EffectTable.h"
#include "DSP/Effects/Reverb/ReverbDesign.h"
#include "DSP/Effects/Reverb/ReverbEngine.h"
#include "DSP/Effects/Reverb/ReverbPresets.h"
#include "DSP/Parts/Limits.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

using Props = ReverbPrivate::_transform_props;

constexpr std::int32_t kSilent = -450;

// The unit of the mix is wrong but fixed: hosts display it.
// clang-format off
constexpr std::array<ParameterRow, 16> kRows{{
    // label                           unit   type       span      floor     shown as             word of the settings
    {L"Pre-delay L",                     L"ms", MPT_INT, { 2000.0f,    0.0f}, Steps(0.1),          WordAt(&Props::preDelay, 0)},
    {L"Pre-delay R",                     L"ms", MPT_INT, { 2000.0f,    0.0f}, Steps(0.1),          WordAt(&Props::preDelay, 1)},
    {L"Mix with early reflections L",    L"dB", MPT_INT, { 2000.0f,    0.0f}, Steps(0.05),         WordAt(&Props::mix, 0)},
    {L"Mix with early reflections R",    L"dB", MPT_INT, { 2000.0f,    0.0f}, Steps(0.05),         WordAt(&Props::mix, 1)},
    {L"Length L",                        L"ms", MPT_INT, {10000.0f,    0.0f}, Steps(1.0, 0),       WordAt(&Props::length, 0)},
    {L"Length R",                        L"ms", MPT_INT, {10000.0f,    0.0f}, Steps(1.0, 0),       WordAt(&Props::length, 1)},
    {L"Damping L",                       L"%",  MPT_INT, { 2500.0f,    0.0f}, Steps(0.04),         WordAt(&Props::damping, 0)},
    {L"Damping R",                       L"%",  MPT_INT, { 2500.0f,    0.0f}, Steps(0.04),         WordAt(&Props::damping, 1)},
    {L"Early reflections L",             L"",   MPT_INT, { 5000.0f,    0.0f}, Steps(0.001, 2),     WordAt(&Props::reflections, 0)},
    {L"Early reflections R",             L"",   MPT_INT, { 5000.0f,    0.0f}, Steps(0.001, 2),     WordAt(&Props::reflections, 1)},
    {L"Room size L",                     L"",   MPT_INT, { 3999.0f,    1.0f}, Steps(0.001, 2),     WordAt(&Props::room, 0)},
    {L"Room size R",                     L"",   MPT_INT, { 3999.0f,    1.0f}, Steps(0.001, 2),     WordAt(&Props::room, 1)},
    {L"Wet level L",                     L"dB", MPT_INT, {  550.0f, -450.0f}, TenthsOfDb(kSilent), WordAt(&Props::wet, 0)},
    {L"Wet level R",                     L"dB", MPT_INT, {  550.0f, -450.0f}, TenthsOfDb(kSilent), WordAt(&Props::wet, 1)},
    {L"Dry level L",                     L"dB", MPT_INT, {  550.0f, -450.0f}, TenthsOfDb(kSilent), WordAt(&Props::dry, 0)},
    {L"Dry level R",                     L"dB", MPT_INT, {  550.0f, -450.0f}, TenthsOfDb(kSilent), WordAt(&Props::dry, 1)},
}};
// clang-format on

const EffectTable& Table() {
    static const EffectTable table{
        .name = "Reverb",
        .image = "builtinReverb.png",
        .icon = "BuiltinPlugins/Reverb@3x.png",
        .rows = kRows,
        .chunk = {.words = kWordsOf<Props>, .wideWords = kWordsOf<Props>},
        .presets = PresetsOf(ReverbPresets::kPresets),
        .sectionLabel = SectionLabel::WithoutSide,
    };
    return table;
}

int Sides(const tWAVEFORMATEX& format) {
    return std::min<int>(format.nChannels, CorvoEffectBase::MaxNumChannels);
}
double Rate(const tWAVEFORMATEX& format) {
    return std::min(static_cast<double>(format.nSamplesPerSec), kFastestHz);
}

}  // namespace

struct Reverb::Engines {
    ReverbEngine<float> single;
    ReverbEngine<double> twofold;

    ReverbEngine<float>& For(float*) { return single; }
    ReverbEngine<double>& For(double*) { return twofold; }
};

Reverb::Reverb() : CorvoEffect(Table(), &m_settings), m_engines(std::make_unique<Engines>()) {
    m_reverse_param_order = true;
    SetPreset(GetDefaultPreset());
}
Reverb::~Reverb() = default;

bool Reverb::SupportsNoninterleaved() { return true; }

void Reverb::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const bool otherWidth = format->wBitsPerSample != m_format.wBitsPerSample;
    const auto cook = TakeCook(m_format, *format, force);
    // The announced format is the only one that needs memory.
    if (force && format->wBitsPerSample != 32) m_engines->single.Free();
    if (force && format->wBitsPerSample != 64) m_engines->twofold.Free();
    if (cook.due || otherWidth) InitState(cook.afresh || otherWidth);
}

void Reverb::InitState(bool reset) {
    InitEnvelopes(true);
    if (m_format.nChannels == 0) return;
    const double rate = Rate(m_format);
    const ReverbDesign design(Snapshot(m_settings), rate);
    const auto cook = [&](auto& engine) {
        if ((reset || !engine.IsReady()) && !engine.Prepare(rate, Sides(m_format))) return;
        engine.Cook(design, rate);
    };
    if (m_format.wBitsPerSample == 32) cook(m_engines->single);
    if (m_format.wBitsPerSample == 64) cook(m_engines->twofold);
}

void Reverb::ClearMemory() {
    m_engines->single.Clear();
    m_engines->twofold.Clear();
}

void Reverb::Cleanup() {
    m_engines->single.Free();
    m_engines->twofold.Free();
    MarkStale();
}

void Reverb::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    if (frames < 1 || format->nChannels == 0) return;
    WithSamples(buffer, *format, OtherWidths::Skip, [&](auto* samples) {
        auto& engine = m_engines->For(samples);
        if (engine.IsReady()) engine.Run({samples, samples + 1}, format->nChannels, frames);
    });
}

void Reverb::ProcessInternalNoninterleaved(double* const* channels, int frames, const tWAVEFORMATEX* format,
                                           ProcessFlags&) {
    CheckCookProperties(format, false);
    if (frames < 1 || format->nChannels == 0) return;
    WithChannels(channels, *format, OtherWidths::Skip, [&](auto* const* samples) {
        auto& engine = m_engines->For(samples[0]);
        if (engine.IsReady()) engine.Run({samples[0], Sides(*format) == 2 ? samples[1] : nullptr}, 1, frames);
    });
}

}  // namespace Corvo::DSP

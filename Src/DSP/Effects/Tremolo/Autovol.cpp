#include "DSP/Effects/Tremolo/Autovol.h"

#include <algorithm>
#include <string_view>
#include <utility>

#include "DSP/Effects/Parameters/EffectTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Effects/Tremolo/AutovolPresets.h"
#include "DSP/Parts/Decibels.h"
#include "DSP/Parts/SampleDispatch.h"
#include "DSP/Parts/SineOscillator.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {

namespace AutovolPrivate {

// What one side does to its samples: sample * (amplitude * sine + offset).
struct Side {
    SineOscillator oscillator;
    double amplitude = 0.0, offset = 0.0;

    // The factors of the next `frames`, at most a piece of the oscillator.
    void TakeFactors(double* factors, int frames) {
        oscillator.StepAndTakeSines(factors, frames);
        for (int i = 0; i < frames; ++i) factors[i] = amplitude * factors[i] + offset;
    }
};

}  // namespace AutovolPrivate

namespace {

using Props = AutovolPrivate::_transform_props;
using Sides = std::array<AutovolPrivate::Side, 2>;

constexpr std::int32_t kSilent = -960;

// Anything off the end of the knob reads "Enabled", though only its other end enables.
constexpr std::array<Choice, 2> kInvert{{{"Disabled", 0.0f}, {"Enabled", 1.0f}}};
constexpr Shown kInverted{[](const ParameterRow& row, double value) {
                              return WithUnit(Widen(kInvert[value != 0.0].text), row.unit);
                          },
                          ParameterTexts::ReadChoice,
                          1.0,
                          0,
                          0,
                          kInvert};
constexpr PlainRange kSwitched{.neutral = 0.0f};

// clang-format off
constexpr std::array<ParameterRow, 10> kRows{{
    // label             unit   type        span      floor     shown as             word of the settings
    {L"Depth L",         L"%",  MPT_FLOAT, {1000.0f,    0.0f}, Steps(0.1),          WordAt(&Props::depth, 0)},
    {L"Depth R",         L"%",  MPT_FLOAT, {1000.0f,    0.0f}, Steps(0.1),          WordAt(&Props::depth, 1)},
    {L"Frequency L",     L"Hz", MPT_FLOAT, {3000.0f,    0.0f}, Steps(0.01),         WordAt(&Props::rate, 0)},
    {L"Frequency R",     L"Hz", MPT_FLOAT, {3000.0f,    0.0f}, Steps(0.01),         WordAt(&Props::rate, 1)},
    {L"Mix L",           L"%",  MPT_FLOAT, {1000.0f,    0.0f}, Steps(0.1),          WordAt(&Props::mix, 0)},
    {L"Mix R",           L"%",  MPT_FLOAT, {1000.0f,    0.0f}, Steps(0.1),          WordAt(&Props::mix, 1)},
    {L"Out gain L",      L"dB", MPT_FLOAT, {1160.0f, -960.0f}, TenthsOfDb(kSilent), WordAt(&Props::outGain, 0)},
    {L"Out gain R",      L"dB", MPT_FLOAT, {1160.0f, -960.0f}, TenthsOfDb(kSilent), WordAt(&Props::outGain, 1)},
    {L"Invert Phase L",  L"",   MPT_ENUM,  {   1.0f,    0.0f}, kInverted,           WordAt(&Props::invert, 0), 0, kSwitched},
    {L"Invert Phase R",  L"",   MPT_ENUM,  {   1.0f,    0.0f}, kInverted,           WordAt(&Props::invert, 1), 0, kSwitched},
}};
// clang-format on

const EffectTable& Table() {
    static const EffectTable table{
        .name = "Tremolo",
        .image = "builtinTremolo.png",
        .icon = "BuiltinPlugins/Tremolo@3x.png",
        .rows = kRows,
        .chunk = {.words = kWordsOf<Props>, .wideWords = kWordsOf<Props>},
        .presets = PresetsOf(AutovolPresets::kPresets),
        .pads = {{"Default", {0, 2}, {4, 6}}, {"Default", {1, 3}, {5, 7}}},  // a side each
        .inputGuard = InputGuard::None,                                      // nothing is remembered
    };
    return table;
}

constexpr std::int32_t kLoudest = 200, kWhole = 1000;
constexpr double kPerMille = 0.001;
constexpr double kRadiansPerRateStep = SineOscillator::kTwoPi / 100.0;

template <typename Sample>
void Modulate(Sample* samples, double factor) {
    *samples = static_cast<Sample>(*samples * factor);
}

template <typename Sample>
void RunPair(Sides& sides, Sample* samples, int frames) {
    constexpr int kPiece = SineOscillator::kPiece;
    std::array<double, kPiece> left, right;
    std::array<double, 2 * kPiece> factors;
    for (int run; frames > 0; frames -= run, samples += 2 * run) {
        run = std::min(frames, kPiece);
        sides[0].TakeFactors(left.data(), run);
        sides[1].TakeFactors(right.data(), run);
        for (std::size_t i = 0; i < static_cast<std::size_t>(run); ++i) {
            factors[2 * i] = left[i];
            factors[2 * i + 1] = right[i];
        }
        for (std::size_t i = 0; i < 2 * static_cast<std::size_t>(run); ++i) Modulate(samples + i, factors[i]);
    }
}

template <typename Sample>
void RunSide(AutovolPrivate::Side& side, Sample* samples, int frames, int stride) {
    std::array<double, SineOscillator::kPiece> factors;
    for (int run; frames > 0; frames -= run) {
        run = std::min(frames, SineOscillator::kPiece);
        side.TakeFactors(factors.data(), run);
        for (std::size_t i = 0; i < static_cast<std::size_t>(run); ++i, samples += stride)
            Modulate(samples, factors[i]);
    }
}

}  // namespace

Autovol::Autovol() : CorvoEffect(Table(), &m_settings), m_sides(std::make_unique<Sides>()) { SetPreset(0); }
Autovol::~Autovol() = default;

void Autovol::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    if (TakeCook(m_format, *format, force).due) InitState(Snapshot(m_settings), *format, force);
}

void Autovol::InitState(const Props& settings, const tWAVEFORMATEX& format, bool force) {
    InitEnvelopes(true);
    const double hz = std::max<std::uint32_t>(format.nSamplesPerSec, 1);
    for (std::size_t i = 0; i < 2; ++i) {
        auto& side = (*m_sides)[i];
        if (force) side.oscillator.SetPhase(0.0);
        side.oscillator.SetIncrement(kRadiansPerRateStep * settings.rate[i] / hz);
        const double gain = GainFromTenthsOfDb(settings.outGain[i], kSilent, kLoudest);
        const double signedGain = settings.invert[i] == 1 ? -gain : gain;
        // Words of a chunk may be anything; they sound like the nearest that the knobs reach.
        const double depth = std::clamp(settings.depth[i], 0, kWhole) * kPerMille;
        const double mix = std::clamp(settings.mix[i], 0, kWhole) * kPerMille;
        if (settings.ringMod[i] == 1) {
            side.amplitude = mix * signedGain;
            side.offset = (1.0 - mix) * signedGain;
        } else {
            const double scale = 1.0 / (1.0 + depth);
            side.amplitude = depth * scale * signedGain;
            side.offset = scale * signedGain;
        }
    }
}

void Autovol::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    if (frames < 1) return;
    const int channels = format->nChannels;
    WithSamples(buffer, *format, OtherWidths::AreFloat, [&](auto* samples) {
        if (channels == 2) return RunPair(*m_sides, samples, frames);
        for (int side = 0; side < std::min(channels, MaxNumChannels); ++side)
            RunSide((*m_sides)[static_cast<std::size_t>(side)], samples + side, frames, channels);
    });
    for (auto& side : *m_sides) side.oscillator.ReducePhase();
}

}  // namespace Corvo::DSP

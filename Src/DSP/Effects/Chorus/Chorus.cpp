#include "DSP/Effects/Chorus/Chorus.h"

#include <algorithm>
#include <new>
#include <utility>

#include "DSP/Effects/Chorus/ChorusKernel.h"
#include "DSP/Effects/Chorus/ChorusPresets.h"
#include "DSP/Effects/Framework/TailRecord.h"
#include "DSP/Effects/Parameters/EffectTable.h"
#include "DSP/Parts/Decibels.h"
#include "DSP/Parts/Limits.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

using Props = ChorusPrivate::_transform_props;
using ChorusPresets::kPresets;

constexpr std::int32_t kSilent = -960, kLoudest = 100;

// clang-format off
constexpr std::array<ParameterRow, 10> kRows{{
    // label         unit   type      span      floor     shown as             word of the settings
    {L"Delay L",     L"ms", MPT_INT, {10000.0f,    0.0f}, Steps(0.1),          WordAt(&Props::delay, 0)},
    {L"Delay R",     L"ms", MPT_INT, {10000.0f,    0.0f}, Steps(0.1),          WordAt(&Props::delay, 1)},
    {L"Frequency L", L"Hz", MPT_INT, {  300.0f,    0.0f}, Steps(0.01, 2),      WordAt(&Props::frequency, 0)},
    {L"Frequency R", L"Hz", MPT_INT, {  300.0f,    0.0f}, Steps(0.01, 2),      WordAt(&Props::frequency, 1)},
    {L"Depth L",     L"%",  MPT_INT, { 1000.0f,    0.0f}, Steps(0.1),          WordAt(&Props::depth, 0)},
    {L"Depth R",     L"%",  MPT_INT, { 1000.0f,    0.0f}, Steps(0.1),          WordAt(&Props::depth, 1)},
    {L"Wet level L", L"dB", MPT_INT, { 1060.0f, -960.0f}, TenthsOfDb(kSilent), WordAt(&Props::wet, 0)},
    {L"Wet level R", L"dB", MPT_INT, { 1060.0f, -960.0f}, TenthsOfDb(kSilent), WordAt(&Props::wet, 1)},
    {L"Dry level L", L"dB", MPT_INT, { 1060.0f, -960.0f}, TenthsOfDb(kSilent), WordAt(&Props::dry, 0)},
    {L"Dry level R", L"dB", MPT_INT, { 1060.0f, -960.0f}, TenthsOfDb(kSilent), WordAt(&Props::dry, 1)},
}};
// clang-format on

// The pads move both sides: what shapes a sound of that kind.
const EffectTable& Table() {
    static const EffectTable table{
        .name = "Chorus",
        .image = "builtinChorus.png",
        .icon = "BuiltinPlugins/Chorus.png",
        .rows = kRows,
        .chunk = {.words = kWordsOf<Props>, .wideWords = kWordsOf<Props>},
        .presets = PresetsOf(kPresets),
        .pads = {{"Default", {0, 1}, {4, 5}}, {"Choruses", {2, 3}, {4, 5}}, {"Flangers", {0, 1}, {2, 3}}},
        .inputGuard = InputGuard::EveryFormat,
    };
    return table;
}

constexpr double kRadiansPerStep = SineOscillator::kTwoPi / 100.0;
constexpr int kFirstCapacity = 480000;  // floats
constexpr double kLongestSeconds = 10.0;

}  // namespace

Chorus::Chorus()
    : CorvoEffect(Table(), &m_settings),
      m_delay(std::make_unique<ChorusPrivate::Delay>()),
      m_ring(std::make_unique_for_overwrite<float[]>(kFirstCapacity)),
      m_capacity(kFirstCapacity) {
    for (int channel : {0, 1}) m_delay->sides[static_cast<std::size_t>(channel)].channel = channel;
    SetPreset(0);
}
Chorus::~Chorus() = default;

int Chorus::Channels() const { return std::clamp<int>(m_format.nChannels, 1, MaxNumChannels); }

void Chorus::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const auto cook = TakeCook(m_format, *format, force);
    if (force) MakeRing();
    if (cook.due) InitState(Snapshot(m_settings), cook.afresh);
}

// Makes room for the longest delay of this format, and keeps what the ring holds.
bool Chorus::MakeRing() {
    const double hz = std::min(static_cast<double>(m_format.nSamplesPerSec), kFastestHz);
    // Two frames even at a rate of 0: the ring is one at least, and InitState wants another.
    const int wanted = Channels() * std::max(static_cast<int>(hz * kLongestSeconds) + 1, 2);
    if (m_ring && wanted <= m_capacity) return true;
    std::unique_ptr<float[]> grown(new (std::nothrow) float[static_cast<std::size_t>(wanted)]);
    if (!grown) return m_ring != nullptr;
    if (m_ring) std::copy_n(m_ring.get(), m_delay->written, grown.get());
    m_ring = std::move(grown);
    m_capacity = wanted;
    return true;
}

bool Chorus::InitState(const Props& settings, bool reset) {
    InitEnvelopes(true);
    if (!m_ring && !MakeRing()) return false;
    const std::int64_t hz = std::max<std::int64_t>(m_format.nSamplesPerSec, 1);
    const int channels = Channels();
    // One frame stays free: the index may stand at the end of a ring that became shorter.
    const std::int64_t longest = m_capacity / channels - 1;
    int frames = 1;
    for (std::size_t i = 0; i < 2; ++i) {
        auto& side = m_delay->sides[i];
        side.oscillator.SetIncrement(kRadiansPerStep / static_cast<double>(hz) * settings.frequency[i]);
        side.wet = GainFromTenthsOfDb(settings.wet[i], kSilent, kLoudest);
        side.dry = GainFromTenthsOfDb(settings.dry[i], kSilent, kLoudest);
        const auto delay = std::clamp<std::int64_t>(settings.delay[i] * hz / 10000, 0, longest);
        const auto depth = std::clamp<std::int64_t>(settings.depth[i] * delay / 1000, 0, delay);
        side.base = static_cast<int>(delay - depth);
        side.amplitude = static_cast<int>(depth / 2);
        if (side.channel < channels) frames = std::max(frames, side.base + 2 * side.amplitude);
    }
    m_ring_length = frames * channels;
    m_longest_gap = 0.0;
    for (const auto& side : m_delay->sides)
        if (side.channel < channels)
            m_longest_gap =
                std::max(m_longest_gap, static_cast<double>(side.base / channels) / static_cast<double>(hz));
    for (std::size_t i = 0; i < 2; ++i) {
        auto& side = m_delay->sides[i];
        if (reset) side.oscillator.SetPhase(0.0);
        side.write = reset ? side.channel : std::min(side.write, m_ring_length);
    }
    return true;
}

void Chorus::InitResetProcessingLight(bool) {
    if (m_ring) std::fill_n(m_ring.get(), m_delay->written, 0.0f);
}

void Chorus::Cleanup() {
    m_ring.reset();
    m_capacity = m_ring_length = m_delay->written = 0;
    MarkStale();
}

void Chorus::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    if (!m_ring || frames < 1 || format->nChannels == 0) return;
    const int channels = Channels();
    const bool restart = m_tail->TakeRestart();
    // Until the tail begins, all of it is left to ring out.
    if (restart || !m_tail->TailMode()) m_tail_left = {};
    for (std::size_t i = 0; i < static_cast<std::size_t>(channels); ++i) {
        auto& side = m_delay->sides[i];
        if (restart) side.write = side.channel;
        if (restart || !m_tail->TailMode()) m_tail_left[i] = side.base / channels;
    }
    const auto allowed = m_tail->Limit(frames, m_tail_left);
    const ChorusPrivate::Ring ring{m_ring.get(), m_ring_length, channels, m_delay->written};
    WithSamples(buffer, *format, OtherWidths::AreFloat, [&](auto* samples) {
        for (std::size_t i = 0; i < static_cast<std::size_t>(channels); ++i)
            m_delay->sides[i].Run(samples + i, allowed[i], format->nChannels, ring);
    });
    for (auto& side : m_delay->sides) side.oscillator.ReducePhase();
}

}  // namespace Corvo::DSP

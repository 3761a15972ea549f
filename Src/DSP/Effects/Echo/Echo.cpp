#include "DSP/Effects/Echo/Echo.h"

#include <algorithm>
#include <cmath>
#include <new>
#include <utility>

#include "DSP/Effects/Echo/EchoDelay.h"
#include "DSP/Effects/Echo/EchoKernel.h"
#include "DSP/Effects/Echo/EchoPresets.h"
#include "DSP/Effects/Framework/TailRecord.h"
#include "DSP/Effects/Parameters/EffectTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Parts/Decibels.h"
#include "DSP/Parts/Limits.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Platform/FiniteSamples.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

using Props = EchoPrivate::_transform_props;
using namespace EchoDelay;
using namespace EchoPresets;

constexpr std::int32_t kFeedbackFloor = -300, kEchoFloor = -300, kOutputFloor = -960;
constexpr std::int32_t kLoudestEcho = 100, kLoudestOutput = 200;
// The echo is silent at -300 already, and shows that as a number.
constexpr std::int32_t kEchoShownSilent = -960;

constexpr std::array<Choice, kModeNames.size()> kModes = [] {
    std::array<Choice, kModeNames.size()> choices{};
    for (std::size_t i = 0; i < choices.size(); ++i)
        choices[i] = {kModeNames[i].data(), static_cast<float>(i) / (choices.size() - 1)};
    return choices;
}();

// How a delay reads depends on the mode and the host's tempo; the effect does that itself.
constexpr Shown kDelay{};

// clang-format off
constexpr std::array<ParameterRow, 12> kRows{{
    // label           unit   type       span      floor     shown as                      word of the settings            section
    {L"Depth L",       L"",   MPT_INT,  {10000.0f,    0.0f}, kDelay,                       WordAt(&Props::depth, 0),       0},
    {L"Depth R",       L"",   MPT_INT,  {10000.0f,    0.0f}, kDelay,                       WordAt(&Props::depth, 1),       0},
    {L"Depth mode L",  L"",   MPT_ENUM, {    4.0f,    0.0f}, OneOf(kModes),                WordAt(&Props::mode),           0},
    {L"Depth mode R",  L"",   MPT_ENUM, {    4.0f,    0.0f}, OneOf(kModes),                WordAt(&Props::modeCopy),       0},
    {L"Decay L",       L"dB", MPT_INT,  {  400.0f, -300.0f}, TenthsOfDb(kFeedbackFloor),   WordAt(&Props::decay, 0),       0},
    {L"Decay R",       L"dB", MPT_INT,  {  400.0f, -300.0f}, TenthsOfDb(kFeedbackFloor),   WordAt(&Props::decay, 1),       0},
    {L"Delay L",       L"dB", MPT_INT,  {  400.0f, -300.0f}, TenthsOfDb(kEchoShownSilent), WordAt(&Props::delayGain, 0),   0},
    {L"Delay R",       L"dB", MPT_INT,  {  400.0f, -300.0f}, TenthsOfDb(kEchoShownSilent), WordAt(&Props::delayGain, 1),   0},
    {L"Mix L",         L"%",  MPT_INT,  { 2000.0f,    0.0f}, Steps(0.1),                   WordAt(&Props::mix, 0),         1},
    {L"Mix R",         L"%",  MPT_INT,  { 2000.0f,    0.0f}, Steps(0.1),                   WordAt(&Props::mix, 1),         1},
    {L"Out gain L",    L"dB", MPT_INT,  { 1160.0f, -960.0f}, TenthsOfDb(kOutputFloor),     WordAt(&Props::outGain, 0),     1},
    {L"Out gain R",    L"dB", MPT_INT,  { 1160.0f, -960.0f}, TenthsOfDb(kOutputFloor),     WordAt(&Props::outGain, 1),     1},
}};
// clang-format on
enum { kDelayLeft, kDelayRight, kModeLeft, kModeRight };

const EffectTable& Table() {
    static const EffectTable table{
        .name = "Echo",
        .image = "builtinEcho.png",
        .icon = "BuiltinPlugins/Echo@3x.png",
        .rows = kRows,
        .chunk = {.words = kWordsOf<Props>, .wordsBefore = 22, .wideWords = 22},
        .presets = AppliedPresets(),
        .pads = {{"Default", {0, 1}, {4, 5}}},
        .sections = {"Delays", "Output"},
        .sectionLabel = SectionLabel::WithoutSide,
        .inputGuard = InputGuard::EveryFormat,
    };
    return table;
}

constexpr double kMixStep = 0.0005;
constexpr std::int32_t kMostMix = 2000;
constexpr double kLongestTimeMs = 10000.0, kLongestNoteMs = 60000.0;
constexpr int kShortestDelay = 10;  // samples

}  // namespace

Echo::Echo() : CorvoEffect(Table(), &m_settings), m_delay(std::make_unique<EchoPrivate::Delay>()) {
    SetPreset(0);
}
Echo::~Echo() = default;

int Echo::Sides() const { return m_format.nChannels >= 2 ? 2 : 1; }

double Echo::DelayMs(std::int32_t mode, std::int32_t depth) const {
    const auto host = HostTempo();
    return EchoDelay::Ms(depth, mode, {host.bpm, host.numerator, host.denominator});
}

// The left mode decides for both sides; the right one only shows it.
bool Echo::DoSetParam(int index, float normalised, bool fromAutomation) {
    if (index == kModeRight) return true;
    if (index != kModeLeft) return CorvoEffect::DoSetParam(index, normalised, fromAutomation);
    SetMode(kRows[kModeLeft].storage.map.Word(normalised));
    return true;
}

// Entering a time mode keeps the delay that is heard; choosing the one it is in already makes the right
// side's delay the left one's.
void Echo::SetMode(std::int32_t mode) {
    const auto before = Snapshot(m_settings);
    StoreShared(m_settings.mode, mode);
    StoreShared(m_settings.modeCopy, mode);
    if (!IsTime(mode)) return;
    for (std::size_t side = 0; side < 2; ++side)
        StoreShared(m_settings.depth[side],
                    mode == before.mode ? before.depth[0]
                                        : EchoDelay::Word(mode, DelayMs(before.mode, before.depth[side])));
}

std::wstring Echo::GetParameterFormattedText(int index, double value) {
    if (index != kDelayLeft && index != kDelayRight)
        return CorvoEffect::GetParameterFormattedText(index, value);
    const auto word = kRows[kDelayLeft].storage.map.Word(static_cast<float>(value));
    const auto mode = LoadShared(m_settings.mode);
    const double ms = std::min(DelayMs(mode, word), 1e9);  // a tempo may be as slow as it likes
    const auto time = WithUnit(FormatInteger(static_cast<std::int64_t>(ms)), L"ms");
    if (!IsTempo(mode)) return time;
    auto note = Widen(kNotes[static_cast<std::size_t>(NoteIndex(word))]);
    if (mode == kDotted) note += L" Dot";
    if (mode == kTriplet) note += L" Triplet";
    return note + L" (" + time + L")";
}

float Echo::GetParamValueNormalizedFromText(int index, std::string text) {
    if (index != kDelayLeft && index != kDelayRight)
        return CorvoEffect::GetParamValueNormalizedFromText(index, text);
    const auto mode = LoadShared(m_settings.mode);
    if (IsTime(mode))
        return kRows[kDelayLeft].storage.map.Normalised(EchoDelay::Word(mode, ParseNumber(text)));
    if (!IsTempo(mode)) return 1.0f;
    int note = FindName(text, kNotes);
    if (note < 0) {
        const auto host = HostTempo();
        note = NearestNote(mode, ParseNumber(text), {host.bpm, host.numerator, host.denominator});
    }
    return static_cast<float>(note) * 0.11111111f;
}

const Props& Echo::GetPresetData(int preset) { return kPresetData[static_cast<std::size_t>(preset)]; }

void Echo::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    if (const auto cook = TakeCook(m_format, *format, force); cook.due) InitState(cook.afresh);
}

bool Echo::InitState(bool reset) {
    InitEnvelopes(true);
    const auto settings = Snapshot(m_settings);
    const double hz = std::min(static_cast<double>(m_format.nSamplesPerSec), kFastestHz);
    const double longest = IsTempo(settings.mode) ? kLongestNoteMs : kLongestTimeMs;
    std::array<int, 2> lengths;
    for (std::size_t i = 0; i < 2; ++i) {
        const double wet = std::clamp(settings.mix[i], 0, kMostMix) * kMixStep;
        m_delay->sides[i] = {.feedback = GainFromTenthsOfDb(settings.decay[i], kFeedbackFloor, kLoudestEcho),
                             .echo = GainFromTenthsOfDb(settings.delayGain[i], kEchoFloor, kLoudestEcho),
                             .wet = wet,
                             .dry = 1.0 - wet,
                             .output = GainFromTenthsOfDb(settings.outGain[i], kOutputFloor, kLoudestOutput)};
        // Settings of any origin: a delay beyond its mode's range is the longest there is.
        const double ms = std::min(DelayMs(settings.mode, settings.depth[i]), longest);
        lengths[i] = static_cast<int>(std::max(ms * hz * 0.001, static_cast<double>(kShortestDelay)));
    }
    if (!LayRing(lengths, reset)) return false;
    m_longest_gap = std::ranges::max(PassFrames()) / std::max(hz, 1.0);
    return true;
}

// The frames of one pass of the ring on each side.
std::array<int, 2> Echo::PassFrames() const {
    return Sides() == 2 ? std::array{m_lengths[0] / 2, m_lengths[1] / 2} : std::array{m_lengths[0], 0};
}

bool Echo::LayRing(std::array<int, 2> lengths, bool reset) {
    const int used = std::max(lengths[0], lengths[1]), sides = Sides();
    if (!m_ring || reset || used != std::max(m_lengths[0], m_lengths[1])) {
        // At first and on reset the memory of every edit to come is made. One more for an odd length.
        const double hz = std::min(static_cast<double>(m_format.nSamplesPerSec), kFastestHz);
        const bool whole = reset || !m_ring;
        const int wanted = 1 + (whole ? std::max(used, static_cast<int>(kLongestTimeMs * 0.001 * hz)) : used);
        if (wanted > m_capacity) {
            std::unique_ptr<float[]> grown(new (std::nothrow) float[static_cast<std::size_t>(wanted)]);
            if (!grown) return false;
            m_ring = std::move(grown);
            m_capacity = wanted;
        }
        m_delay->lines[0] = {.ring = m_ring.get()};
        m_delay->lines[1] = {.ring = m_ring.get() + (sides == 2 ? (used + 1) / 2 : 0)};
    }
    m_lengths = lengths;
    m_delay->lines[0].length = (lengths[0] + sides - 1) / sides;
    m_delay->lines[1].length = lengths[1] / 2;
    return true;
}

void Echo::InitResetProcessingLight(bool) {
    if (!m_ring) return;
    for (auto& line : m_delay->lines) line.Silence();
}

void Echo::Cleanup() {
    m_ring.reset();
    m_capacity = 0;
    MarkStale();
}

void Echo::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    if (!m_ring || frames <= 0 || format->nChannels == 0) return;
    const bool restart = m_tail->TakeRestart();
    if (restart) m_delay->lines[0].position = m_delay->lines[1].position = 0;
    // Until the tail begins, a whole pass of the ring is left to ring out.
    if (restart || !m_tail->TailMode()) m_tail_left = PassFrames();
    const auto allowed = m_tail->Limit(frames, m_tail_left);
    WithSamples(buffer, *format, OtherWidths::AreFloat, [&](auto* samples) { Run(samples, allowed); });
}

template <typename Sample>
void Echo::Run(Sample* samples, std::array<int, 2> frames) {
    const int channels = m_format.nChannels;
    int done = 0;
    bool finite = true;
    const auto all = [](const auto* from, int count) {
        return AllFinite(from, static_cast<std::size_t>(count));
    };
    auto& [left, right] = m_delay->lines;
    for (const int both = channels == 2 ? std::min(frames[0], frames[1]) : 0; done < both;) {
        const int run = std::min({both - done, left.UntilWrap(), right.UntilWrap()});
        Sample* const block = samples + 2 * done;
        float *const atLeft = left.MakeReady(run), *const atRight = right.MakeReady(run);
        if (RunEchoPair(m_delay->sides, block, run, atLeft, atRight))
            finite &= all(atLeft, run) && all(atRight, run) && all(block, 2 * run);
        left.Advance(run);
        right.Advance(run);
        done += run;
    }
    for (int side = 0; side < Sides(); ++side) {
        const auto i = static_cast<std::size_t>(side);
        auto& line = m_delay->lines[i];
        for (int at = done; at < frames[i];) {
            const int run = std::min(frames[i] - at, line.UntilWrap());
            finite &=
                !RunEchoSide(m_delay->sides[i], samples + static_cast<std::ptrdiff_t>(at) * channels + side,
                             channels, run, line.MakeReady(run));
            line.Advance(run);
            at += run;
        }
    }
    if (!finite) InitResetProcessingLight(false);
}

}  // namespace Corvo::DSP

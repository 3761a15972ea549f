#include "DSP/Effects/Echo/Echo.h"

#include <algorithm>
#include <cmath>
#include <new>
#include <utility>

#include "DSP/Effects/Echo/EchoDelay.h"
#include "DSP/Effects/Echo/EchoKernel.h"
#include "DSP/Effects/Echo/EchoPresets.h"
#include "DSP/Effects/Parameters/FixedPoint.h"
#include "DSP/Effects/Parameters/ParameterTable.h"
#include "DSP/Effects/Parameters/ParameterText.h"
#include "DSP/Effects/Parameters/WordChunk.h"
#include "DSP/Parts/Decibels.h"
#include "DSP/Parts/SampleDispatch.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

using Props = EchoPrivate::_transform_props;
using namespace EchoDelay;
using namespace EchoPresets;

enum class Show { Delay, Mode, TenthsOfDb, Percent };

struct Row {
    const wchar_t *label, *unit;
    MP_TYPE type;
    FixedPoint map;
    Show show;
    std::int32_t silent;  // shown as "-Inf."
    Props::Pair Props::*field;
    std::size_t side;
    int section;
};

// "Delay" is silent at -300 already and shows that as a number.
// clang-format off
constexpr std::array<Row, 12> kRows{{
    // label           unit   type       span      floor     shown as          silent  field             side, section
    {L"Depth L",       L"",   MPT_INT,  {10000.0f,    0.0f}, Show::Delay,         0, &Props::depth,     0, 0},
    {L"Depth R",       L"",   MPT_INT,  {10000.0f,    0.0f}, Show::Delay,         0, &Props::depth,     1, 0},
    {L"Depth mode L",  L"",   MPT_ENUM, {    4.0f,    0.0f}, Show::Mode,          0, nullptr,           0, 0},
    {L"Depth mode R",  L"",   MPT_ENUM, {    4.0f,    0.0f}, Show::Mode,          0, nullptr,           1, 0},
    {L"Decay L",       L"dB", MPT_INT,  {  400.0f, -300.0f}, Show::TenthsOfDb, -300, &Props::decay,     0, 0},
    {L"Decay R",       L"dB", MPT_INT,  {  400.0f, -300.0f}, Show::TenthsOfDb, -300, &Props::decay,     1, 0},
    {L"Delay L",       L"dB", MPT_INT,  {  400.0f, -300.0f}, Show::TenthsOfDb, -960, &Props::delayGain, 0, 0},
    {L"Delay R",       L"dB", MPT_INT,  {  400.0f, -300.0f}, Show::TenthsOfDb, -960, &Props::delayGain, 1, 0},
    {L"Mix L",         L"%",  MPT_INT,  { 2000.0f,    0.0f}, Show::Percent,       0, &Props::mix,       0, 1},
    {L"Mix R",         L"%",  MPT_INT,  { 2000.0f,    0.0f}, Show::Percent,       0, &Props::mix,       1, 1},
    {L"Out gain L",    L"dB", MPT_INT,  { 1160.0f, -960.0f}, Show::TenthsOfDb, -960, &Props::outGain,   0, 1},
    {L"Out gain R",    L"dB", MPT_INT,  { 1160.0f, -960.0f}, Show::TenthsOfDb, -960, &Props::outGain,   1, 1},
}};
// clang-format on
constexpr int kModeLeft = 2;

constexpr std::int32_t kFeedbackFloor = -300, kEchoFloor = -300, kOutputFloor = -960;
constexpr double kMixStep = 0.0005, kPercentStep = 0.1;
constexpr double kLongestTimeMs = 10000.0, kLongestNoteMs = 60000.0;
constexpr int kShortestDelay = 10;    // samples
constexpr double kFastestHz = 768e3;  // bounds the memory for formats that nobody has

bool Has(int index) { return index >= 0 && index < static_cast<int>(kRows.size()); }
bool HasPreset(int preset) { return preset >= 0 && preset < static_cast<int>(kPresets.size()); }
const Row& RowAt(int index) { return kRows[static_cast<std::size_t>(index)]; }

std::int32_t WordFromNumber(double number) {
    return static_cast<std::int32_t>(std::lround(number > 0.0 ? std::min(number, 1e6) : 0.0));
}

// The words that were there before there were modes.
constexpr auto kVisitOldWords = [](auto&& visit, auto& s) {
    return visit(s.decay) && visit(s.mix) && visit(s.depth) && visit(s.delayGain) && visit(s.reserved) &&
           visit(s.outGain) && visit(s.reserved2);
};
constexpr auto kVisitWords = [](auto&& visit, auto& s) {
    return kVisitOldWords(visit, s) && visit(s.mode) && visit(s.modeCopy);
};
using SettingsChunk = WordChunk<Props, kVisitWords>;
using ChunkWithoutMode = WordChunk<Props, kVisitOldWords, sizeof(Props) / 4 - 2>;

}  // namespace

Echo::Echo() { SetPreset(0); }
Echo::~Echo() = default;

int Echo::Sides() const { return m_format.nChannels >= 2 ? 2 : 1; }

int Echo::GetParamCountReal() { return static_cast<int>(kRows.size()); }
int Echo::GetSettingsChunkSize() { return SettingsChunk::kSize; }
int Echo::NumPresets() { return static_cast<int>(kPresets.size()); }
std::string Echo::GetName() { return "Echo"; }
std::string Echo::GetImage() { return "builtinEcho.png"; }
std::string Echo::GetPluginIconPath() { return "BuiltinPlugins/Echo@3x.png"; }
std::vector<std::string> Echo::GetParamUiSections() { return {"Delays", "Output"}; }
bool Echo::WantsXySerialization() { return true; }

const MP_PARAMINFO* Echo::GetParametersInfo() {
    static const auto records = MakeNormalisedTable(kRows, 1);
    return records.data();
}

double Echo::DelayMs(std::int32_t mode, std::int32_t depth) const {
    const auto host = HostTempo();
    return EchoDelay::Ms(depth, mode, {host.bpm, host.numerator, host.denominator});
}

bool Echo::DoSetParam(int index, float normalised, bool) {
    if (!Has(index)) return true;
    const Row& row = RowAt(index);
    if (row.field)
        StoreShared((m_settings.*row.field)[row.side], row.map.Word(normalised));
    else if (index == kModeLeft)
        SetMode(row.map.Word(normalised));
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

float Echo::GetParamPlain(int index) const {
    if (!Has(index)) return 0.0f;
    const Row& row = RowAt(index);
    if (!row.field)
        return static_cast<float>(LoadShared(row.side == 0 ? m_settings.mode : m_settings.modeCopy));
    return static_cast<float>(LoadShared((m_settings.*row.field)[row.side]));
}

float Echo::GetParam(int index) {
    return Has(index) ? RowAt(index).map.Normalised(static_cast<std::int32_t>(GetParamPlain(index))) : 0.0f;
}

float Echo::GetParamFromProp(int index, int preset) {
    if (!Has(index) || !HasPreset(preset)) return -1.0f;
    const Row& row = RowAt(index);
    const auto props = Applied(preset);
    return row.map.Normalised(row.field ? (props.*row.field)[row.side] : props.mode);
}

std::wstring Echo::GetParameterFormattedText(int index, double value) {
    if (!Has(index)) return {};
    const Row& row = RowAt(index);
    const auto word = row.map.Word(static_cast<float>(value));
    switch (row.show) {
        case Show::Mode:
            return Widen(kModeNames[static_cast<std::size_t>(word)]);
        case Show::TenthsOfDb:
            return WithUnit(FormatTenthsOfDb(word, row.silent), row.unit);
        case Show::Percent:
            return WithUnit(FormatFixed(word * kPercentStep, 1), row.unit);
        case Show::Delay:
            break;
    }
    const auto mode = LoadShared(m_settings.mode);
    const double ms = std::min(DelayMs(mode, word), 1e9);  // a tempo may be as slow as it likes
    const auto time = WithUnit(FormatInteger(static_cast<std::int64_t>(ms)), L"ms");
    if (!IsTempo(mode)) return time;
    auto note = Widen(kNotes[static_cast<std::size_t>(NoteIndex(word))]);
    if (mode == kDotted) note += L" Dot";
    if (mode == kTriplet) note += L" Triplet";
    return note + L" (" + time + L")";
}

float Echo::DelayFromText(int index, const std::string& text) const {
    const auto mode = LoadShared(m_settings.mode);
    if (IsTime(mode)) return RowAt(index).map.Normalised(EchoDelay::Word(mode, ParseNumber(text)));
    if (!IsTempo(mode)) return 1.0f;
    int note = FindName(text, kNotes);
    if (note < 0) {
        const auto host = HostTempo();
        note = NearestNote(mode, ParseNumber(text), {host.bpm, host.numerator, host.denominator});
    }
    return static_cast<float>(note) * 0.11111111f;
}

float Echo::GetParamValueNormalizedFromText(int index, std::string text) {
    if (!Has(index)) return -1.0f;
    const Row& row = RowAt(index);
    switch (row.show) {
        case Show::Mode:
            if (const int mode = FindName(text, kModeNames); mode >= 0) return row.map.Normalised(mode);
            return -1.0f;
        case Show::TenthsOfDb:
            return row.map.Normalised(ParseTenthsOfDb(text, row.silent));
        case Show::Percent:
            return row.map.Normalised(WordFromNumber(ParseNumber(text) / kPercentStep));
        case Show::Delay:
            break;
    }
    return DelayFromText(index, text);
}

std::vector<std::string> Echo::GetParameterAvailableValues(int index) {
    if (!Has(index) || RowAt(index).show != Show::Mode) return {};
    return {kModeNames.begin(), kModeNames.end()};
}

void Echo::GetParamSectionInfo(int index, PluginParameterInfo& info) {
    if (!Has(index)) return;
    info = {};
    info.param_index = index;
    info.layout_group = RowAt(index).section;
    info.values = GetParameterAvailableValues(index);
    info.label = Narrow(GetParamName(index));
}

void Echo::InitializeXyEditingData(GenericUIData& data) {
    constexpr int kDepthLeft = 0, kDepthRight = 1, kDecayLeft = 4, kDecayRight = 5;
    data.groups = {MakeGroup("Default", 0, {kDepthLeft, kDepthRight}, {kDecayLeft, kDecayRight})};
    data.entries = {"Default"};
}

std::string Echo::GetPresetName(int preset) {
    return HasPreset(preset) ? kPresets[static_cast<std::size_t>(preset)].name : std::string();
}

const Props& Echo::GetPresetData(int preset) { return kPresetData[static_cast<std::size_t>(preset)]; }

void Echo::SetPreset(int preset) {
    if (!HasPreset(preset)) return;
    Assign(m_settings, Applied(preset));
    m_cook.store(true, std::memory_order_release);
}

void Echo::GetSettingsChunk(std::vector<std::uint8_t>& chunk) {
    SettingsChunk::Write(chunk, m_chunk_tag, m_settings);
}

void Echo::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    const bool taken = chunk.size() == ChunkWithoutMode::kSize
                           ? ChunkWithoutMode::Read(chunk, m_chunk_tag, m_settings)
                           : SettingsChunk::Read(chunk, m_chunk_tag, m_settings);
    if (taken) m_cook.store(true, std::memory_order_release);
}

bool Echo::FitsOldChunk(const std::vector<std::uint8_t>& chunk) {
    const bool fits = ChunkWithoutMode::ReadOld(chunk, m_chunk_tag, m_settings);
    if (fits) m_cook.store(true, std::memory_order_release);
    return fits;
}

void Echo::CheckCookProperties(const tWAVEFORMATEX* format, bool force) {
    const bool changed =
        format->nChannels != m_format.nChannels || format->nSamplesPerSec != m_format.nSamplesPerSec;
    m_format = *format;
    if (m_cook.exchange(false, std::memory_order_acquire) || force || changed) InitState(force || changed);
}

bool Echo::InitState(bool reset) {
    InitEnvelopes(true);
    const auto settings = Snapshot(m_settings);
    const double hz = std::min(static_cast<double>(m_format.nSamplesPerSec), kFastestHz);
    const double longest = IsTempo(settings.mode) ? kLongestNoteMs : kLongestTimeMs;
    std::array<int, 2> lengths;
    for (std::size_t i = 0; i < 2; ++i) {
        const double wet = settings.mix[i] * kMixStep;
        m_sides[i] = {.feedback = GainFromTenthsOfDb(settings.decay[i], kFeedbackFloor),
                      .echo = GainFromTenthsOfDb(settings.delayGain[i], kEchoFloor),
                      .wet = wet,
                      .dry = 1.0 - wet,
                      .output = GainFromTenthsOfDb(settings.outGain[i], kOutputFloor)};
        // Settings of any origin: a delay beyond its mode's range is the longest there is.
        const double ms = std::min(DelayMs(settings.mode, settings.depth[i]), longest);
        lengths[i] = static_cast<int>(std::max(ms * hz * 0.001, static_cast<double>(kShortestDelay)));
    }
    return LayRing(lengths, reset);
}

bool Echo::LayRing(std::array<int, 2> lengths, bool reset) {
    const int used = std::max(lengths[0], lengths[1]), sides = Sides();
    if (!m_ring || reset || used != std::max(m_lengths[0], m_lengths[1])) {
        // At first and on reset the memory of every edit to come is made and touched. One more for an odd
        // length.
        const double hz = std::min(static_cast<double>(m_format.nSamplesPerSec), kFastestHz);
        const bool whole = reset || !m_ring;
        const int wanted = 1 + (whole ? std::max(used, static_cast<int>(kLongestTimeMs * 0.001 * hz)) : used);
        if (wanted > m_capacity) {
            std::unique_ptr<float[]> grown(new (std::nothrow) float[static_cast<std::size_t>(wanted)]);
            if (!grown) return false;
            m_ring = std::move(grown);
            m_capacity = wanted;
        }
        std::fill_n(m_ring.get(), wanted, 0.0f);
        m_lines[0].ring = m_ring.get();
        m_lines[1].ring = m_ring.get() + (sides == 2 ? (used + 1) / 2 : 0);
        m_lines[0].position = m_lines[1].position = 0;
    }
    m_lengths = lengths;
    m_lines[0].length = (lengths[0] + sides - 1) / sides;
    m_lines[1].length = lengths[1] / 2;
    return true;
}

void Echo::InitResetProcessingLight(bool) {
    if (m_ring) std::fill_n(m_ring.get(), m_capacity, 0.0f);
}

void Echo::Cleanup() {
    m_ring.reset();
    m_capacity = 0;
    m_cook.store(true, std::memory_order_release);
}

void Echo::ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags&) {
    CheckCookProperties(format, false);
    if (!m_ring || frames <= 0 || format->nChannels == 0) return;
    const bool restart = m_tail.TakeRestart();
    if (restart) m_lines[0].position = m_lines[1].position = 0;
    // Until the tail begins, a whole pass of the ring is left to ring out.
    if (restart || !m_tail.TailMode())
        m_tail_left =
            Sides() == 2 ? std::array{m_lengths[0] / 2, m_lengths[1] / 2} : std::array{m_lengths[0], 0};
    const auto allowed = m_tail.Limit(frames, m_tail_left);
    WithSamples(buffer, *format, OtherWidths::AreFloat, [&](auto* samples) { Run(samples, allowed); });
}

template <typename Sample>
void Echo::Run(Sample* samples, std::array<int, 2> frames) {
    const int channels = m_format.nChannels;
    int done = 0;
    auto& [left, right] = m_lines;
    for (const int both = channels == 2 ? std::min(frames[0], frames[1]) : 0; done < both;) {
        const int run = std::min({both - done, left.UntilWrap(), right.UntilWrap()});
        RunEchoPair(m_sides, samples + 2 * done, run, left.Here(), right.Here());
        left.Advance(run);
        right.Advance(run);
        done += run;
    }
    for (int side = 0; side < Sides(); ++side) {
        const auto i = static_cast<std::size_t>(side);
        auto& line = m_lines[i];
        for (int at = done; at < frames[i];) {
            const int run = std::min(frames[i] - at, line.UntilWrap());
            RunEchoSide(m_sides[i], samples + static_cast<std::ptrdiff_t>(at) * channels + side, channels,
                        run, line.Here());
            line.Advance(run);
            at += run;
        }
    }
}

}  // namespace Corvo::DSP

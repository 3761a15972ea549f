#include "Adapter.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <span>
#include <stdexcept>
#include <thread>

#include "DSP/Effects/EffectKinds.h"
#include "DSP/Effects/SettingsInput.h"
#include "SampleCopies.h"

namespace Corvo::Plugins {
namespace {

constexpr int kStep = 4;          // frames between two steps of a glide, and of a short piece
constexpr double kGlide = 0.010;  // seconds
constexpr double kBypass = 0.020;
constexpr double kLongestLag = 0.5;  // seconds of latency that the bypass can follow
constexpr int kLongestPiece = 4096;

}  // namespace

// Sets parameters apart from each other: the thread that processes goes on without, others wait for it.
class Adapter::Gate {
public:
    enum class If { Free, Waiting };
    Gate(std::atomic_flag& busy, If when) : m_busy(busy) {
        while (!(m_open = !m_busy.test_and_set(std::memory_order_acquire)) && when == If::Waiting)
            std::this_thread::yield();
    }
    ~Gate() {
        if (m_open) m_busy.clear(std::memory_order_release);
    }
    Gate(const Gate&) = delete;
    Gate& operator=(const Gate&) = delete;
    explicit operator bool() const { return m_open; }

private:
    std::atomic_flag& m_busy;
    bool m_open = false;
};

Adapter::Adapter(const PluginRow& row, int channels, Values values)
    : Core(row, channels, LayoutOf(row, channels)),
      m_values(values),
      m_effect(row.Make()),
      m_planar(m_effect->SupportsNoninterleaved()),
      m_results(row.results ? row.results->make(*m_effect) : nullptr),
      m_controls(static_cast<std::size_t>(std::ranges::count(Ports(), false, &Port::isOutput))),
      m_newest(Ports().size() - m_controls.size()),
      m_told(m_newest.size()) {
    m_effect->SetHostCallback(this);
    SetChannels(channels);
    ReadBack();
    SilenceResults();
}

Adapter::~Adapter() = default;

void Adapter::SetChannels(int channels) {
    m_longest = 0;
    Core::SetChannels(channels);
    if (m_effect->GetNumSidechainBusses() == 0) return;
    m_sideChannels = std::min(channels, m_effect->GetSidechainBusNumChannelsMax(0));
    m_effect->SetSidechainBusNumChannels(0, m_sideChannels);
}

void Adapter::GetTimeSignature(int& numerator, int& denominator) {
    numerator = m_numerator;
    denominator = m_denominator;
}

void Adapter::Tempo(double bpm, int numerator, int denominator) {
    if (!(bpm > 0.0 && std::isfinite(bpm)) || numerator <= 0 || denominator <= 0) return;
    if (bpm == m_bpm && numerator == m_numerator && denominator == m_denominator) return;
    m_bpm = bpm;
    m_numerator = numerator;
    m_denominator = denominator;
    m_effect->NotifyTempoChanged();
}

void Adapter::Prepare(double rate, int frames) {
    const Gate gate(m_busy, Gate::If::Waiting);
    m_longest = 0;
    TakeEdits(false);
    const int longest = std::clamp(frames, kStep, kLongestPiece);
    m_format = {};
    m_format.nChannels = static_cast<std::uint16_t>(Channels());
    m_format.nSamplesPerSec = static_cast<std::uint32_t>(std::lround(std::clamp(rate, 1000.0, 768000.0)));
    m_format.wBitsPerSample = 32;
    const auto piece = static_cast<std::size_t>(longest);
    const auto ring = std::bit_ceil(piece + static_cast<std::size_t>(kLongestLag * rate));
    for (std::size_t c = 0; c < static_cast<std::size_t>(Channels()); ++c) {
        m_wet[c].assign(piece, 0.0f);
        m_side[c].assign(m_sideChannels > 0 ? piece : 0, 0.0f);
        m_dry[c].assign(ring, 0.0f);
    }
    m_interleaved.assign(m_planar || Channels() == 1 ? 0 : 2 * piece, 0.0f);
    m_glideSteps = std::max(1, static_cast<int>(kGlide * rate / kStep));
    m_mixStep = static_cast<float>(1.0 / (kBypass * rate));
    m_longest = longest;  // now that there is memory for it
    m_effect->Cleanup();
    Start();
}

// Prepared for what it is prepared for already, an effect keeps its memory; Cleanup would free it.
void Adapter::Reset() {
    if (m_longest == 0) return;
    const Gate gate(m_busy, Gate::If::Free);
    if (gate) TakeEdits(false);
    for (auto& ring : m_dry) std::ranges::fill(ring, 0.0f);
    if (Row().Is(kMayWait) || Row().Is(kOnlyClears))
        m_effect->Cleanup();
    else
        m_effect->InitResetProcessingLight(true);
    Start();
}

void Adapter::Start() {
    m_effect->InitProcessing(m_longest, &m_format);
    m_sideHeard = false;
    m_fresh = true;
    UpdateLatency();
    TellResults();  // what came before is over
    SilenceResults();
}

void Adapter::SilenceResults() {
    for (std::size_t i = 0; i < m_newest.size(); ++i)
        m_told[i] = m_newest[i] = Ports()[m_controls.size() + i].start;
}

void Adapter::TellResults() {
    if (m_results) m_results->Read(m_newest);
    for (std::size_t i = 0; i < m_newest.size(); ++i) {
        const Port& port = Ports()[m_controls.size() + i];
        m_told[i] = std::clamp(m_newest[i], port.least, port.most);
    }
}

void Adapter::UpdateLatency() {
    const auto most = static_cast<int>(m_dry[0].size()) - m_longest;
    m_latency = std::clamp(m_effect->GetLatency(), 0, std::max(most, 0));
}

// The values that the effect has, after it changed as a whole.
void Adapter::ReadBack() {
    m_gliding = 0;
    for (std::size_t i = 0; i < m_controls.size(); ++i) {
        const Port& port = Ports()[i];
        Control& control = m_controls[i];
        control.position = control.target = m_effect->GetParam(port.parameter);
        control.wanted = port.ValueOf(*m_effect);
        control.edited = control.touched = false;
        control.stepsLeft = 0;
    }
    m_edits = false;
}

void Adapter::Set(int index, float value) {
    if (static_cast<std::size_t>(index) >= m_controls.size()) return;
    const Port& port = Ports()[static_cast<std::size_t>(index)];
    Control& control = m_controls[static_cast<std::size_t>(index)];
    if (!std::isfinite(value)) return;
    value = std::clamp(value, port.least, port.most);
    if (port.whole) value = std::round(value);
    // Hosts write numbers as text; what comes back must not edit settings that are finer than a port.
    const float before = control.wanted;
    if (std::abs(value - before) <= 1e-6f * (std::abs(before) + port.most - port.least)) return;
    control.wanted = value;
    control.edited = true;
    m_edits = true;
}

void Adapter::Recall(const std::vector<float>& values) {
    const auto copy = Copy();
    for (std::size_t i = 0; i < m_controls.size() && i < values.size(); ++i) {
        const Port& port = Ports()[i];
        const float value = std::clamp(values[i], port.least, port.most);
        if (!std::isfinite(values[i]) || port.momentary) continue;
        const float before = copy->GetParam(port.parameter);
        port.SetOn(*copy, port.Position(value), false);
        if (copy->GetParam(port.parameter) == before) m_controls[i].wanted = value;
    }
}

float Adapter::Value(int port) const {
    const auto index = static_cast<std::size_t>(port);
    return index < m_controls.size() ? m_controls[index].wanted : m_told[index - m_controls.size()];
}

// A list is set as by a user: some effects make things ready then. Nothing else happens at the same time.
void Adapter::Apply(std::size_t index, float position) {
    const Port& port = Ports()[index];
    m_controls[index].position = position;
    const bool automated = port.type != EffectParameterType::List && m_longest > 0;
    port.SetOn(*m_effect, position, automated);
}

// Of the lists, or of all others. Whether there were any.
bool Adapter::TakeEditsOf(bool lists, bool glide) {
    bool any = false;
    for (std::size_t i = 0; i < m_controls.size(); ++i) {
        Control& control = m_controls[i];
        const Port& port = Ports()[i];
        if ((port.type == EffectParameterType::List) != lists || !control.edited.exchange(false)) continue;
        any = true;
        control.target = port.Position(control.wanted);
        const bool glides = glide && port.glides;
        m_gliding += static_cast<int>(glides) - static_cast<int>(control.stepsLeft > 0);
        control.stepsLeft = glides ? m_glideSteps : 0;
        control.touched = true;
        if (!glides) Apply(i, control.target);
        if (!port.springsBack) continue;
        control.wanted = port.start;
        m_otherValues = true;
    }
    return any;
}

void Adapter::ReadBackOthers() {
    for (std::size_t i = 0; i < m_controls.size(); ++i) {
        Control& control = m_controls[i];
        if (control.stepsLeft > 0 || control.edited) continue;
        const Port& port = Ports()[i];
        const float position = m_effect->GetParam(port.parameter);
        const bool moved = port.type == EffectParameterType::Continuous && position != control.position;
        control.touched = moved && position >= 1.0f;
        // It may lie beyond the end of its control: no state with it would be taken again.
        if (control.touched) Apply(i, 1.0f);
        const float value = port.Value(position), before = control.wanted;
        const double step =
            std::max(1.01 * port.resolution, 5e-4 * static_cast<double>(port.most - port.least));
        control.position = control.target = position;
        if (std::abs(value - before) <= static_cast<float>(step)) continue;
        control.wanted = value;
        m_otherValues = true;
    }
}

void Adapter::KeepOthers() {
    for (std::size_t i = 0; i < m_controls.size(); ++i) {
        Control& control = m_controls[i];
        if (control.edited || m_effect->GetParam(Ports()[i].parameter) == control.position) continue;
        control.touched = true;
        Apply(i, control.position);
    }
}

void Adapter::TakeEdits(bool glide) {
    if (!m_edits.load() || !m_edits.exchange(false)) return;  // exchanging takes longer
    // Lists first: one may move other parameters with it, those that the host leaves alone.
    if (TakeEditsOf(true, false)) m_values == Values::OfHost ? KeepOthers() : ReadBackOthers();
    TakeEditsOf(false, glide);
}

void Adapter::StepGlides() {
    for (std::size_t i = 0; i < m_controls.size(); ++i) {
        Control& control = m_controls[i];
        if (control.stepsLeft == 0) continue;
        const float left = control.target - control.position;
        Apply(i, control.stepsLeft == 1 ? control.target
                                        : control.position + left / static_cast<float>(control.stepsLeft));
        if (--control.stepsLeft == 0) --m_gliding;
    }
}

void Adapter::Run(const float* const* in, float* const* out, const float* const* side, int frames) {
    if (m_longest == 0) return;
    const Gate gate(m_busy, Gate::If::Free);
    if (gate) TakeEdits(!m_fresh);
    m_goal = Bypassed() ? 0.0f : 1.0f;
    if (m_fresh) m_mix = m_goal;
    for (int done = 0; done < frames;) {
        const int piece = std::min(frames - done, m_longest);
        std::array<const float*, 2> from{}, beside{};
        std::array<float*, 2> to{};
        for (std::size_t c = 0; c < static_cast<std::size_t>(Channels()); ++c) {
            from[c] = in[c] + done;
            to[c] = out[c] + done;
            if (side && c < static_cast<std::size_t>(m_sideChannels) && side[c]) beside[c] = side[c] + done;
        }
        TakeSide(beside, piece);
        TakeInput(from, to, piece);
        for (int at = 0; at < piece;) {
            const bool gliding = gate && m_gliding > 0;
            if (gliding) StepGlides();
            const int count = gliding || Row().Is(kShortPieces) ? std::min(piece - at, kStep) : piece - at;
            ProcessEffect(at, count);
            at += count;
        }
        Give(to, piece);
        done += piece;
        m_fresh = false;
    }
    UpdateLatency();
    TellResults();
}

// Calls work(place, done, count) for each unbroken part of a ring: `count` frames from `place`, after `done`
// ones.
template <typename Work>
void AlongRing(std::size_t size, std::size_t from, std::size_t frames, Work work) {
    const std::size_t place = from & (size - 1), first = std::min(frames, size - place);
    work(place, std::size_t{0}, first);
    if (first < frames) work(std::size_t{0}, first, frames - first);
}

void Adapter::TakeInput(const std::array<const float*, 2>& in, const std::array<float*, 2>& out, int frames) {
    const auto count = static_cast<std::size_t>(frames), channels = static_cast<std::size_t>(Channels());
    // The host's own output is the place to work in, unless it is another channel's input.
    const bool apart = channels == 1 || (out[0] != out[1] && out[0] != in[1] && out[1] != in[0]);
    for (std::size_t c = 0; c < channels; ++c) m_work[c] = apart ? out[c] : m_wet[c].data();
    if (m_interleaved.empty())
        for (std::size_t c = 0; c < channels; ++c) CopyFinite(in[c], m_work[c], count);
    else
        Interleave(in[0], in[1], m_interleaved.data(), count);
    // The ring is needed only where something may be mixed with it.
    if (m_latency > 0 || m_goal < 1.0f || m_mix < 1.0f)
        for (std::size_t c = 0; c < channels; ++c)
            AlongRing(m_dry[c].size(), m_dryAt, count,
                      [&](std::size_t place, std::size_t done, std::size_t part) {
                          CopyFinite(in[c] + done, &m_dry[c][place], part);
                      });
    m_dryAt += count;
}

void Adapter::TakeSide(const std::array<const float*, 2>& side, int frames) {
    m_sideIsThere = false;
    if (m_sideChannels == 0 || !side[0]) return;
    for (std::size_t c = 0; c < static_cast<std::size_t>(m_sideChannels); ++c) {
        const auto sound = std::span(m_side[c]).first(static_cast<std::size_t>(frames));
        CopyFinite(side[c] ? side[c] : side[0], sound.data(), sound.size());
        m_sideHeard = m_sideHeard || std::ranges::any_of(sound, [](float sample) { return sample != 0.0f; });
    }
    m_sideIsThere = m_sideHeard;
}

void Adapter::ProcessEffect(int at, int frames) {
    const auto channels = [at](float* left, float* right) {
        return std::array{reinterpret_cast<double*>(left + at),
                          right ? reinterpret_cast<double*>(right + at) : nullptr};
    };
    if (m_sideIsThere)
        m_effect->SetSidechainBuffer(
            0, channels(m_side[0].data(), m_sideChannels > 1 ? m_side[1].data() : nullptr).data());
    DSP::ProcessFlags flags;
    if (m_planar)
        m_effect->ProcessNoninterleaved(channels(m_work[0], m_work[1]).data(), frames, &m_format, flags);
    else
        m_effect->Process(m_interleaved.empty() ? m_work[0] + at : m_interleaved.data() + 2 * at, frames,
                          &m_format, flags);
}

void Adapter::Give(const std::array<float*, 2>& out, int frames) {
    const auto count = static_cast<std::size_t>(frames), channels = static_cast<std::size_t>(Channels());
    if (!m_interleaved.empty()) Separate(m_interleaved.data(), m_work[0], m_work[1], count);
    if (m_mix == 1.0f && m_goal == 1.0f) {
        for (std::size_t c = 0; c < channels; ++c)
            if (m_interleaved.empty() || out[c] != m_work[c]) CopyFinite(m_work[c], out[c], count);
        return;
    }
    const std::size_t from = m_dryAt - count - static_cast<std::size_t>(m_latency.load());
    const float goal = m_goal, step = goal > m_mix ? m_mixStep : -m_mixStep;
    float mix = m_mix;
    for (std::size_t c = 0; c < channels; ++c) {
        mix = m_mix;
        AlongRing(m_dry[c].size(), from, count, [&](std::size_t place, std::size_t done, std::size_t part) {
            const float *const dry = &m_dry[c][place], *const wet = m_work[c] + done;
            float* const to = out[c] + done;
            for (std::size_t i = 0; i < part; ++i) {
                if (mix != goal) mix = std::clamp(mix + step, 0.0f, 1.0f);
                // Neither end rounds.
                to[i] = mix == 0.0f ? dry[i] : mix == 1.0f ? wet[i] : dry[i] + mix * (wet[i] - dry[i]);
            }
            CopyFinite(to, to, part);
        });
    }
    m_mix = mix;
}

std::unique_ptr<DSP::CorvoEffectBase> Adapter::Copy() {
    std::vector<std::uint8_t> chunk;
    m_effect->GetSettingsChunk(chunk);
    auto copy = Row().Make();
    copy->SetSettingsChunk(chunk);
    copy->SetHostCallback(this);
    return copy;
}

// Ports on their way count as arrived; and an effect may keep what was automated to itself.
std::vector<std::uint8_t> Adapter::State() {
    std::vector<std::uint8_t> chunk;
    m_effect->GetSettingsChunk(chunk);
    const auto touched = [](const Control& control) { return control.touched || control.edited; };
    if (std::ranges::none_of(m_controls, touched)) return chunk;
    const auto copy = Copy();
    for (const bool lists : {true, false})
        for (std::size_t i = 0; i < m_controls.size(); ++i) {
            const Port& port = Ports()[i];
            const bool isList = port.type == EffectParameterType::List;
            if (isList != lists || !touched(m_controls[i]) || port.momentary) continue;
            const float position = port.Position(m_controls[i].wanted);
            if (copy->GetParam(port.parameter) != position) port.SetOn(*copy, position, false);
        }
    copy->GetSettingsChunk(chunk);
    return chunk;
}

bool Adapter::TakeState(const std::vector<std::uint8_t>& bytes) {
    // An effect leaves everything as it was, without a word, when it does not take a chunk: one that is read
    // makes an instance of lowest and one of highest values the same.
    const auto low = Row().Make(), high = Row().Make();
    std::vector<std::uint8_t> before, after;
    for (int i = 0; i < low->GetParamCount(); ++i) low->SetParam(i, 0.0f, false);
    for (int i = 0; i < high->GetParamCount(); ++i) high->SetParam(i, 1.0f, false);
    low->SetSettingsChunk(bytes);
    high->SetSettingsChunk(bytes);
    low->GetSettingsChunk(before);
    high->GetSettingsChunk(after);
    if (before != after) return false;
    // Nor are settings taken that no control gives: such a file is damaged.
    const DSP::EffectKind* const kind = DSP::FindEffectKind(Row().name);
    if (kind && !DSP::ParameterOutOfRange(*kind, *low).empty()) return false;
    const Gate gate(m_busy, Gate::If::Waiting);
    m_effect->SetSettingsChunk(bytes);
    ReadBack();
    UpdateLatency();
    return true;
}

void Adapter::TakePreset(int preset) {
    if (preset < 0 || preset >= Presets()) return;
    const Gate gate(m_busy, Gate::If::Waiting);
    m_effect->SetPreset(preset);
    ReadBack();
    UpdateLatency();
}

std::string Adapter::Text(int index, float value) {
    const Port& port = Ports()[static_cast<std::size_t>(index)];
    if (port.isOutput) return Core::Text(index, value);
    if (port.type != EffectParameterType::Continuous)
        return port.points[static_cast<std::size_t>(std::lround(std::clamp(value, port.least, port.most)))]
            .text;
    return ShownAt(*Copy(), port.parameter, port.Position(value));
}

bool Adapter::FromText(int index, const std::string& text, float& value) {
    const Port& port = Ports()[static_cast<std::size_t>(index)];
    if (port.isOutput) return Core::FromText(index, text, value);
    for (const auto& point : port.points)
        if (point.text == text) {
            value = point.value;
            return true;
        }
    if (port.type != EffectParameterType::Continuous) return false;
    try {
        const auto copy = Copy();
        const float read = copy->GetParamValueNormalizedFromText(port.parameter, text);
        if (!(read >= 0.0f)) return false;
        const float position = PositionThatShows(*copy, port.parameter, std::min(read, 1.0f), text);
        copy->SetParam(port.parameter, position, false);
        value = port.ValueOf(*copy);
        // Several places may show the same number, and a text tell them apart.
        if (Text(index, value) != text) value = port.curve.Number(position);
        return true;
    } catch (const std::logic_error&) {
        return false;
    }
}

}  // namespace Corvo::Plugins

#include "Adapter.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <span>
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

}  // namespace Corvo::Plugins

#include "DSP/Pitch/PitchAdapterCorvoOld.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <numbers>
#include <numeric>

#include "DSP/Pitch/ClassicKernel.h"
#include "Platform/DenormalGuard.h"
#include "Platform/FiniteSamples.h"
#include "Platform/Processor.h"
#include "Threads/SharedRecord.h"

namespace Corvo::DSP {
namespace {

constexpr double kPi = std::numbers::pi;
constexpr std::size_t kMostFrame = 10000;
constexpr std::size_t kMostBins = kMostFrame / 2 + 1;

enum Change : std::size_t { kSteady, kFell, kRose };

const ClassicPitch::Kernels& kernels =
    HasAvx2() ? ClassicPitch::Avx2Kernels() : ClassicPitch::BaselineKernels();

template <typename Table>
std::size_t Limited(const Table& table, int index) {
    return static_cast<std::size_t>(std::clamp(index, 0, static_cast<int>(table.size()) - 1));
}

// A frequency away from the bin's own, from a change of phase: less what the bin itself advances, wrapped to
// half a turn either way, in bins.
double BinsOff(double phaseChange, double advance, int oversampling) {
    double d = phaseChange - advance;
    int turns = static_cast<int>(d / kPi);
    turns += turns >= 0 ? turns & 1 : -(turns & 1);
    d -= kPi * turns;
    return oversampling * d / (2.0 * kPi);
}

}  // namespace

struct PitchAdapterCorvoOld::Channel {
    std::array<float, kMostFrame> input, output;
    std::array<float, kMostBins> accumulator, magnitude;
    std::array<double, kMostBins> advance;
    std::array<double, kMostBins> phase;  // double: it grows without end, and a float would soon be noise
    std::array<std::int32_t, kMostBins> last;          // the bits of the last frame's windowed samples
    std::array<float, kMostBins> strength, frequency;  // of the frame's bins before they move
    std::array<double, kMostBins> moved;               // the advances that they take with them
    std::array<std::int32_t, kMostBins> target;        // where they go; only the first `sources` go anywhere
    int rover;
    float pitch;
    // What is known of `placedPitch`: where bins go, and how many tables of their advances are made.
    bool placed;
    float placedPitch;
    std::size_t sources, tables;
};

PitchAdapterCorvoOld::PitchAdapterCorvoOld() : m_state(std::make_unique<std::array<Channel, 2>>()) {
    // Room for every frame size, so that cooking only fills what is there.
    m_window.reserve(kFFTSizes.back());
    m_emptyAdvances.reserve(kMostBins);
    for (auto& table : m_frequencies) table.reserve(kMostBins);
    for (auto& tables : m_advances)
        for (auto& table : tables) table.reserve(kMostBins);
}
PitchAdapterCorvoOld::~PitchAdapterCorvoOld() = default;

void PitchAdapterCorvoOld::SetSampleRate(int rate) { m_rate = rate; }

void PitchAdapterCorvoOld::SetPitchFactor(int channel, float factor) {
    if ((channel == 0 || channel == 1) && std::isfinite(factor))
        StoreShared(m_factors[static_cast<std::size_t>(channel)], factor);
}

void PitchAdapterCorvoOld::SetFFTSize(int index) { m_size = kFFTSizes[Limited(kFFTSizes, index)]; }

void PitchAdapterCorvoOld::SetQuality(int index) {
    m_oversampling = kOversampling[Limited(kOversampling, index)];
}

void PitchAdapterCorvoOld::CookFactors() {
    if (m_size == 0 || m_oversampling == 0) return;
    m_step = m_size / m_oversampling;
    m_latency = m_size - m_step;
    m_expectedPhase = m_step * 2.0 * kPi / m_size;
    // The rate cancels out of the sound; without one there would be nothing to cancel.
    m_binWidth = static_cast<double>(std::max(m_rate, 1)) / m_size;

    for (Channel& channel : *m_state) {
        channel = {};
        channel.rover = m_latency;
        channel.pitch = 1.0f;
    }
    m_window.resize(static_cast<std::size_t>(m_size));
    for (std::size_t k = 0; k < m_window.size(); ++k)
        m_window[k] = 0.5 - 0.5 * std::cos(2.0 * kPi * static_cast<double>(k) / m_size);

    constexpr double kChanges[] = {0.0, kPi, -kPi};  // steady, fell, rose
    const auto bins = static_cast<std::size_t>(m_size / 2) + 1;
    for (std::size_t change = 0; change < m_frequencies.size(); ++change) {
        auto& table = m_frequencies[change];
        table.resize(bins);
        for (std::size_t k = 0; k < bins; ++k) {
            const auto bin = static_cast<double>(k);
            const double off = BinsOff(kChanges[change], bin * m_expectedPhase, m_oversampling);
            table[k] = static_cast<float>(bin * m_binWidth + off * m_binWidth);
        }
    }
    for (auto& tables : m_advances)
        for (auto& table : tables) table.resize(bins);
    // Bins that nothing goes to have the frequency 0.
    m_emptyAdvances.resize(bins);
    Channel& any = m_state->front();
    std::iota(any.target.begin(), any.target.end(), 0);
    TakeAdvances(any, any.frequency.data(), 0.0f, bins, m_emptyAdvances.data());
}

void PitchAdapterCorvoOld::ProcessInPlace(double*, int) {}

void PitchAdapterCorvoOld::ProcessInPlace(float* buffer, int frames) {
    // A new frame size waits for CookFactors.
    if (m_window.empty() || m_window.size() != static_cast<std::size_t>(m_size)) return;
    const DenormalGuard guard;
    ReplaceNonFinite(buffer, frames, m_channels, 2);
    for (int channel = 0; channel < std::min(m_channels, 2); ++channel)
        if (channel == 0 || m_channels == 2)
            ShiftChannel(static_cast<std::size_t>(channel), buffer + channel, frames, m_channels);
}

void PitchAdapterCorvoOld::ShiftChannel(std::size_t side, float* samples, int frames, int stride) {
    Channel& channel = (*m_state)[side];
    channel.pitch = static_cast<float>(0.6 * LoadShared(m_factors[side]) + 0.4 * channel.pitch);
    while (frames > 0) {
        const int count = std::min(frames, m_size - channel.rover);
        auto* in = channel.input.data() + channel.rover;
        const auto* out = channel.output.data() + (channel.rover - m_latency);
        for (int i = 0; i < count; ++i, samples += stride) {
            in[i] = *samples;
            *samples = out[i];
        }
        channel.rover += count;
        frames -= count;
        if (channel.rover < m_size) continue;
        channel.rover = m_latency;
        ShiftFrame(side);
    }
}

// The phase advances at `pitch` of the first `count` bins, each in its target.
void PitchAdapterCorvoOld::TakeAdvances(const Channel& c, const float* frequencies, float pitch,
                                        std::size_t count, double* advances) const {
    kernels.advance({frequencies, c.target.data(), pitch, m_binWidth, m_expectedPhase,
                     static_cast<double>(m_oversampling), advances},
                    count);
}

// Each bin's strength and advance, and where it goes. While the pitch stands the advances come from tables;
// they are made one in a frame, so that none takes long.
void PitchAdapterCorvoOld::Analyse(Channel& c, Tables<double>& advances, std::size_t bins) {
    const auto with = [&]<typename Number>(const Tables<Number>& tables, Number* found) {
        return ClassicPitch::Analysis<Number>{
            c.input.data(),       m_window.data(), tables[kSteady].data(), tables[kFell].data(),
            tables[kRose].data(), c.last.data(),   c.strength.data(),      found};
    };
    if (!c.placed || c.pitch != c.placedPitch) {
        kernels.place({c.pitch, c.target.data()}, bins);
        const auto* const all = c.target.data();
        c.sources =
            static_cast<std::size_t>(std::find(all, all + bins, static_cast<std::int32_t>(bins)) - all);
        std::copy_n(m_emptyAdvances.begin(), bins, c.advance.begin());
        c.placed = true;
        c.placedPitch = c.pitch;
        c.tables = 0;
    } else if (c.tables < advances.size()) {
        TakeAdvances(c, m_frequencies[c.tables].data(), c.pitch, c.sources, advances[c.tables].data());
        ++c.tables;
    }
    if (c.tables == advances.size()) {
        kernels.analyseStanding(with(advances, c.moved.data()), bins);
    } else {
        kernels.analyse(with(m_frequencies, c.frequency.data()), bins);
        TakeAdvances(c, c.frequency.data(), c.pitch, c.sources, c.moved.data());
    }
}

void PitchAdapterCorvoOld::ShiftFrame(std::size_t side) {
    Channel& c = (*m_state)[side];
    const std::size_t bins = m_emptyAdvances.size();
    const auto size = static_cast<std::ptrdiff_t>(m_size), step = static_cast<std::ptrdiff_t>(m_step);

    // Every bin moves to where the pitch takes it. Amplitudes meet there, the last advance stays.
    Analyse(c, m_advances[side], bins);
    std::fill_n(c.magnitude.begin(), bins, 0.0f);
    for (std::size_t k = 0; k < c.sources; ++k) {
        const auto j = static_cast<std::size_t>(c.target[k]);
        c.magnitude[j] += c.strength[k];
        c.advance[j] = c.moved[k];
    }

    kernels.synthesise(
        {c.magnitude.data(), c.advance.data(), m_window.data(),
         static_cast<double>(m_size / 2) * m_oversampling, c.phase.data(), c.accumulator.data()},
        bins);
    std::copy_n(c.accumulator.begin(), step, c.output.begin());
    const auto end = c.accumulator.begin() + static_cast<std::ptrdiff_t>(bins);
    std::fill(std::copy(c.accumulator.begin() + step, end, c.accumulator.begin()), end, 0.0f);
    std::copy(c.input.begin() + step, c.input.begin() + size, c.input.begin());
}

}  // namespace Corvo::DSP

#include "DSP/Pitch/PitchAdapterCorvoOld.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <numbers>

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
    std::array<float, 2 * kMostFrame> accumulator;
    std::array<float, kMostBins> magnitude, frequency;
    std::array<double, kMostBins> phase;  // double: it grows without end, and a float would soon be noise
    std::array<std::int32_t, kMostBins> last;      // the bits of the last frame's windowed samples
    std::array<float, kMostBins> strength, moved;  // of the frame's bins before they move
    std::array<std::int32_t, kMostBins> target;
    int rover;
    float pitch;
};

PitchAdapterCorvoOld::PitchAdapterCorvoOld() : m_state(std::make_unique<std::array<Channel, 2>>()) {
    // Room for every frame size, so that cooking only fills what is there.
    m_window.reserve(kFFTSizes.back());
    for (auto& table : m_frequencies) table.reserve(kMostBins);
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
    for (std::size_t change = 0; change < m_frequencies.size(); ++change) {
        auto& table = m_frequencies[change];
        table.resize(static_cast<std::size_t>(m_size / 2) + 1);
        for (std::size_t k = 0; k < table.size(); ++k) {
            const auto bin = static_cast<double>(k);
            const double off = BinsOff(kChanges[change], bin * m_expectedPhase, m_oversampling);
            table[k] = static_cast<float>(bin * m_binWidth + off * m_binWidth);
        }
    }
}

void PitchAdapterCorvoOld::ProcessInPlace(double*, int) {}

void PitchAdapterCorvoOld::ProcessInPlace(float* buffer, int frames) {
    // A new frame size waits for CookFactors.
    if (m_window.empty() || m_window.size() != static_cast<std::size_t>(m_size)) return;
    const DenormalGuard guard;
    ReplaceNonFinite(buffer, frames, m_channels, 2);
    for (int channel = 0; channel < std::min(m_channels, 2); ++channel) {
        const auto side = static_cast<std::size_t>(channel);
        if (channel == 0 || m_channels == 2)
            ShiftChannel((*m_state)[side], buffer + channel, frames, m_channels, LoadShared(m_factors[side]));
    }
}

void PitchAdapterCorvoOld::ShiftChannel(Channel& channel, float* samples, int frames, int stride,
                                        float factor) {
    channel.pitch = static_cast<float>(0.6 * factor + 0.4 * channel.pitch);
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
        ShiftFrame(channel, channel.pitch);
    }
}

void PitchAdapterCorvoOld::ShiftFrame(Channel& c, float pitch) {
    const std::size_t bins = static_cast<std::size_t>(m_size / 2) + 1;
    const auto size = static_cast<std::ptrdiff_t>(m_size), step = static_cast<std::ptrdiff_t>(m_step);

    // Analysis, and every bin moved to where the pitch takes it. Amplitudes meet there, the last frequency
    // stays.
    kernels.analyse({c.input.data(), m_window.data(), m_frequencies[kSteady].data(),
                     m_frequencies[kFell].data(), m_frequencies[kRose].data(), pitch, c.last.data(),
                     c.strength.data(), c.moved.data(), c.target.data()},
                    bins);
    std::fill_n(c.magnitude.begin(), bins, 0.0f);
    std::fill_n(c.frequency.begin(), bins, 0.0f);
    for (std::size_t k = 0; k < bins; ++k) {
        const auto j = static_cast<std::size_t>(c.target[k]);
        if (j >= bins) break;  // as all that follow
        c.magnitude[j] += c.strength[k];
        c.frequency[j] = c.moved[k];
    }

    kernels.synthesise({c.magnitude.data(), c.frequency.data(), m_window.data(), m_binWidth, m_expectedPhase,
                        static_cast<double>(m_oversampling), static_cast<double>(m_size / 2) * m_oversampling,
                        c.phase.data(), c.accumulator.data()},
                       bins);
    std::copy_n(c.accumulator.begin(), step, c.output.begin());
    std::copy(c.accumulator.begin() + step, c.accumulator.begin() + size + step, c.accumulator.begin());
    std::copy(c.input.begin() + step, c.input.begin() + size, c.input.begin());
}

}  // namespace Corvo::DSP

#include "DSP/Effects/Tube/TubeOversampling.h"

#include <algorithm>
#include <limits>
#include <memory>
#include <new>
#include <type_traits>

namespace Corvo::DSP {
namespace {

// Filters of every factor, designed once for all instances.
struct Designs {
    std::array<SamplingFrequencyConverter, TubeBuffer::kLargestFactor + 1> up, down;

    Designs() {
        for (const int factor : {2, 4, 8, 12, 16}) {
            const bool designed = up[static_cast<std::size_t>(factor)].InitConversionByFactors(factor, 1) &&
                                  down[static_cast<std::size_t>(factor)].InitConversionByFactors(1, factor);
            if (!designed) throw std::bad_alloc();  // the next instance tries again
        }
    }
};

const Designs& AllDesigns() {
    static const Designs designs;
    return designs;
}

template <typename In, typename Out>
int Convert(SamplingFrequencyConverter& converter, int frames, void* in, void* out, int channels) {
    return converter.sfreq_conversion_core_block<In, Out>(
        frames, static_cast<char*>(in), static_cast<char*>(out), channels, channels * In::kBytes,
        channels * Out::kBytes, nullptr);
}

}  // namespace

void TubeBuffer::Prepare(int maxFrames) {
    constexpr std::size_t kPerFrame = kLargestFactor * kMaxChannels;
    constexpr std::size_t kMost = std::numeric_limits<std::ptrdiff_t>::max() / sizeof(double) / kPerFrame;
    const auto frames = std::min(static_cast<std::size_t>(std::max(maxFrames, 0)), kMost);
    if (frames <= static_cast<std::size_t>(m_capacity)) return;
    m_samples.reset(new (std::nothrow) double[frames * kPerFrame]);
    m_capacity = m_samples ? static_cast<int>(frames) : 0;
}

void TubeBuffer::Free() {
    m_samples.reset();
    m_capacity = 0;
}

struct TubeOversampling::Filters {
    static constexpr int kRing = 10 * TubeBuffer::kLargestFactor;

    SamplingFrequencyConverter up, down;
    std::array<double, 2 * TubeBuffer::kMaxChannels * kRing> rings{};

    Filters() {
        double* ring = rings.data();
        for (auto* converter : {&up, &down}) {
            converter->ringCapacity = kRing;
            for (int channel = 0; channel < TubeBuffer::kMaxChannels; ++channel, ring += kRing)
                converter->rings[channel] = ring;
        }
    }
};

struct TubeOversampling::Memory {
    alignas(Filters) std::byte bytes[sizeof(Filters)];
};

TubeOversampling::TubeOversampling() : m_memory(std::make_unique_for_overwrite<Memory>()) {
    AllDesigns();  // which live on, so that Clear never drops the last reference to one while audio runs
}

TubeOversampling::~TubeOversampling() {
    if (m_filters) std::destroy_at(m_filters);
}

void TubeOversampling::Clear(int factor) {
    const auto index = static_cast<std::size_t>(factor);
    if (factor > 1 && !m_filters) m_filters = new (m_memory->bytes) Filters;
    // Both filters or none: at two factors they would not give back as many frames as they took.
    const bool raised = factor > 1 && m_filters->up.Restart(AllDesigns().up[index]) &&
                        m_filters->down.Restart(AllDesigns().down[index]);
    m_factor = raised ? factor : 1;
}

double TubeOversampling::Delay(int factor) {
    const auto index = static_cast<std::size_t>(factor);
    return (AllDesigns().up[index].GroupDelay() + AllDesigns().down[index].GroupDelay()) / factor;
}

template <typename Sample>
void TubeOversampling::Process(const VirtualTubeAmp& amp, TubeBuffer& buffer, Sample* samples, int frames,
                               int channels) {
    using In = std::conditional_t<std::is_same_v<Sample, float>, tipo_floatbit, tipo_doublebit>;
    using Out = std::conditional_t<std::is_same_v<Sample, float>, tipo_floatbit_outd, tipo_doublebit_outd>;
    if (m_factor == 1) return amp.Shape(samples, frames, channels);
    double* const raised = buffer.Samples();
    while (frames > 0) {
        const int piece = std::min(frames, buffer.Frames());
        const int raisedFrames =
            Convert<In, tipo_doublebit_outd>(m_filters->up, piece, samples, raised, channels);
        amp.Shape(raised, raisedFrames, channels);
        Convert<tipo_doublebit, Out>(m_filters->down, raisedFrames, raised, samples, channels);
        samples += static_cast<std::ptrdiff_t>(piece) * channels;
        frames -= piece;
    }
}

template void TubeOversampling::Process(const VirtualTubeAmp&, TubeBuffer&, float*, int, int);
template void TubeOversampling::Process(const VirtualTubeAmp&, TubeBuffer&, double*, int, int);

}  // namespace Corvo::DSP

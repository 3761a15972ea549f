#include "DSP/Effects/Tube/TubeOversampling.h"

#include <algorithm>
#include <limits>
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

bool HasRings(const SamplingFrequencyConverter& converter) {
    return std::all_of(converter.rings, converter.rings + TubeBuffer::kMaxChannels,
                       [](const double* ring) { return ring != nullptr; });
}

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

TubeOversampling::TubeOversampling() {
    // Designs that live on, so that Clear never drops the last reference to one while audio runs.
    m_up = AllDesigns().up[TubeBuffer::kLargestFactor];
    m_up.Init(TubeBuffer::kMaxChannels);
    m_down = AllDesigns().down[TubeBuffer::kLargestFactor];
    m_down.Init(TubeBuffer::kMaxChannels);
    if (HasRings(m_up) && HasRings(m_down)) return;
    m_up.FreeRings();
    m_down.FreeRings();
    throw std::bad_alloc();
}

TubeOversampling::~TubeOversampling() {
    m_up.FreeRings();
    m_down.FreeRings();
}

void TubeOversampling::Clear(int factor) {
    const auto index = static_cast<std::size_t>(factor);
    // Both filters or none: at two factors they would not give back as many frames as they took.
    const bool raised =
        factor > 1 && m_up.Restart(AllDesigns().up[index]) && m_down.Restart(AllDesigns().down[index]);
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
        const int raisedFrames = Convert<In, tipo_doublebit_outd>(m_up, piece, samples, raised, channels);
        amp.Shape(raised, raisedFrames, channels);
        Convert<tipo_doublebit, Out>(m_down, raisedFrames, raised, samples, channels);
        samples += static_cast<std::ptrdiff_t>(piece) * channels;
        frames -= piece;
    }
}

template void TubeOversampling::Process(const VirtualTubeAmp&, TubeBuffer&, float*, int, int);
template void TubeOversampling::Process(const VirtualTubeAmp&, TubeBuffer&, double*, int, int);

}  // namespace Corvo::DSP

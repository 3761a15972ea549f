#pragma once

#include <array>
#include <cstddef>
#include <memory>

#include "DSP/Effects/Tube/VirtualTubeAmp.h"
#include "DSP/Resampler/SamplingFrequencyConverter.h"

namespace Corvo::DSP {

// One complete copy of what the tube distortion processes with: the amplifier, and the converters and
// buffer for shaping at a multiple of the stream's rate. Memory is made by the constructor and by
// AllocateBuffer, for the largest factor; nothing else allocates.
class TubeOversampling {
public:
    static constexpr int kLargestFactor = 16, kMaxChannels = 2;

    TubeOversampling();
    ~TubeOversampling();
    TubeOversampling(const TubeOversampling&) = delete;
    TubeOversampling& operator=(const TubeOversampling&) = delete;

    // For blocks of up to `maxFrames`. Without it, or without memory, blocks go through in short pieces.
    void AllocateBuffer(int maxFrames);
    void FreeBuffer();

    // Starts with silent filters at `factor`, one that the amplifier knows.
    void Restart(int factor);
    int Factor() const { return m_factor; }

    // Shapes interleaved frames of one or two channels in place, at `factor` times their rate.
    template <typename Sample>
    void Shape(Sample* samples, int frames, int channels);

    // What both converters delay low frequencies by, in frames of the stream.
    static double Delay(int factor);

    VirtualTubeAmp amp;

private:
    static constexpr int kReserveFrames = 16;  // pieces without a buffer

    int m_factor = 1;
    SamplingFrequencyConverter m_up, m_down;
    int m_capacity = 0;  // in frames of the stream
    std::unique_ptr<double[]> m_buffer;
    std::array<double, kReserveFrames * kLargestFactor * kMaxChannels> m_reserve{};
};

}  // namespace Corvo::DSP

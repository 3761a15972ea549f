#pragma once

#include <array>
#include <cstddef>
#include <memory>

#include "DSP/Effects/Tube/VirtualTubeAmp.h"
#include "DSP/Resampler/SamplingFrequencyConverter.h"

namespace Corvo::DSP {

// Memory for blocks at the raised rate. Without any, they go through in short pieces.
class TubeBuffer {
public:
    static constexpr int kLargestFactor = 16, kMaxChannels = 2;

    // For blocks of up to `maxFrames` of the stream, at any factor. Keeps what is larger already; without
    // memory there is no buffer.
    void Prepare(int maxFrames);
    void Free();

    double* Samples() { return m_samples ? m_samples.get() : m_reserve.data(); }
    int Frames() const { return m_samples ? m_capacity : kReserveFrames; }  // of the stream

private:
    static constexpr int kReserveFrames = 16;

    int m_capacity = 0;
    std::unique_ptr<double[]> m_samples;
    std::array<double, kReserveFrames * kLargestFactor * kMaxChannels> m_reserve{};
};

// The filters that take the stream up to a multiple of its rate and back. Their memory, for every factor, is
// made by the constructor, which throws std::bad_alloc; nothing else allocates. It is not touched before a
// factor above 1 is.
class TubeOversampling {
public:
    TubeOversampling();
    ~TubeOversampling();
    TubeOversampling(const TubeOversampling&) = delete;
    TubeOversampling& operator=(const TubeOversampling&) = delete;

    // Silent filters for `factor`, one that the amplifier knows.
    void Clear(int factor);
    int Factor() const { return m_factor; }

    // Shapes interleaved frames of one or two channels in place, at the factor times their rate.
    template <typename Sample>
    void Process(const VirtualTubeAmp& amp, TubeBuffer& buffer, Sample* samples, int frames, int channels);

    // What both filters delay low frequencies by, in frames of the stream.
    static double Delay(int factor);

private:
    struct Filters;
    struct Memory;

    int m_factor = 1;
    std::unique_ptr<Memory> m_memory;
    Filters* m_filters = nullptr;  // in it, once they were needed
};

}  // namespace Corvo::DSP

#pragma once

#include <array>
#include <cstdint>
#include <span>

#include "DSP/Effects/Denoiser/SizeReducer.h"

namespace Corvo::DSP::Denoising {

// Puts the outputs of several window lengths together. Per band of frequency and moment the output follows
// the length that is expected to be nearest to the clean signal, by an estimate of the squared error that
// needs no clean signal (Stein's), over the noise's power; lengths that are about equal share.
class SizeBlend {
public:
    // `grid`: the tables of the blend's own window.
    void Prepare(Arena& arena, WindowTables& grid, std::span<const SizeReducer> sizes, std::size_t channels,
                 double rate);

    // Of a frame's work: the output of each length is analysed, one step each, then comes the rest.
    int Steps() const { return static_cast<int>(m_sizes.size()) + 1; }
    struct Job {
        std::int64_t frame;
        std::span<const std::array<SampleRing, kMostChannels>> inputs;  // of each length
        std::span<const SampleRing> output;
    };
    void Run(int step, const Job& job);

private:
    static constexpr std::size_t kMostSizes = 3, kMostTile = 63;

    void Analyse(std::size_t size, const Job& job);
    void Weigh(std::int64_t frame);
    float RiskAt(const SizeReducer& size, std::int64_t gridFrame, std::size_t band) const;
    void Combine(std::size_t channel, const Job& job);

    const SpectrumKernels* m_kernels = nullptr;
    WindowTables* m_grid = nullptr;
    std::span<const SizeReducer> m_sizes;
    std::size_t m_channels = 0, m_bands = 0;
    std::int64_t m_ahead = 0, m_riskFrames = 0;  // grid frames whose risks are known
    std::array<float, kMostTile> m_tile{};
    std::int64_t m_before = 0;
    float m_sharpness = 0.0f;
    FrameRing m_risks[kMostSizes];
    float *m_re[kMostSizes][kMostChannels]{}, *m_im[kMostSizes][kMostChannels]{};
    float *m_weights[kMostSizes]{}, *m_outRe = nullptr, *m_outIm = nullptr;
};

}  // namespace Corvo::DSP::Denoising

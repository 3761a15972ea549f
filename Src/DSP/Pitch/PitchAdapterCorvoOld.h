#pragma once

#include <array>
#include <memory>
#include <vector>

#include "DSP/Pitch/PitchAdapter.h"

namespace Corvo::DSP {

// The "Classic" back-end: a frame-based shifter for one or two channels of float samples. The windowed
// samples themselves are analysed and resynthesised, without a transform before or after; that is its sound.
class PitchAdapterCorvoOld final : public PitchAdapter {
public:
    static constexpr std::array kFFTSizes{256, 512, 1024, 2048, 4096, 8192};
    static constexpr std::array kOversampling{2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 16, 24, 32};

    PitchAdapterCorvoOld();

    void SetSampleRate(int rate) override;
    void SetPitchFactor(int channel, float factor) override;
    void CookFactors() override;
    void SetFFTSize(int index) override;
    void SetQuality(int index) override;
    void ProcessInPlace(double* buffer, int frames) override;
    void ProcessInPlace(float* buffer, int frames) override;
    ~PitchAdapterCorvoOld() override;

private:
    struct Channel;

    // One for each way in which a bin's sign can go from frame to frame.
    template <typename Number>
    using Tables = std::array<std::vector<Number>, 3>;

    void TakeAdvances(const Channel& channel, const float* frequencies, float pitch, std::size_t count,
                      double* advances) const;
    void Analyse(Channel& channel, Tables<double>& advances, std::size_t bins);
    void ShiftChannel(std::size_t side, float* samples, int frames, int stride);
    void ShiftFrame(std::size_t side);

    int m_rate = 0;
    std::array<float, 2> m_factors{};  // taken from another thread while audio runs
    int m_size = 0;
    int m_oversampling = 0;
    int m_step = 0, m_latency = 0;
    double m_expectedPhase = 0.0, m_binWidth = 0.0;
    std::vector<double> m_window;
    Tables<float> m_frequencies;  // of each bin before it is moved; see CookFactors
    std::vector<double> m_emptyAdvances;
    std::array<Tables<double>, 2> m_advances;  // of each channel's bins, while its pitch stands
    std::unique_ptr<std::array<Channel, 2>> m_state;
};

}  // namespace Corvo::DSP

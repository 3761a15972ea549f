#include "DSP/Effects/Denoiser/MaskingLimit.h"

#include <algorithm>
#include <cmath>

namespace Corvo::DSP::Denoising {
namespace {

constexpr double kBandsPerBark = 2.0;

// Zwicker's and Terhardt's critical-band rate.
double Bark(double hz) {
    return 13.0 * std::atan(0.00076 * hz) + 3.5 * std::atan((hz / 7500.0) * (hz / 7500.0));
}

}  // namespace

void MaskingLimit::Prepare(Arena& arena, std::size_t bins) {
    m_band = {reinterpret_cast<std::uint16_t*>(arena.Take((bins + 1) / 2)), bins};
    m_share = arena.Take(bins);
}

void MaskingLimit::SetRate(double rate) {
    m_count = {};
    const double width = rate / (2.0 * static_cast<double>(m_band.size() - 1));
    for (std::size_t bin = 0; bin < m_band.size(); ++bin) {
        const double place = std::min(kBandsPerBark * Bark(static_cast<double>(bin) * width), kBands - 2.0);
        m_band[bin] = static_cast<std::uint16_t>(place);
        m_share[bin] = static_cast<float>(place - m_band[bin]);
        m_count[m_band[bin]] += 1.0f - m_share[bin];
        m_count[m_band[bin] + 1u] += m_share[bin];
    }
    m_bands = m_band.back() + std::size_t{2};
}

void MaskingLimit::Apply(float* gain, const float* ratio, const float* noise, const float* curve,
                         float offsetDb) const {
    std::array<float, kBands> signal{}, threshold{};
    for (std::size_t bin = 0; bin < m_band.size(); ++bin) {
        const float power = gain[bin] * gain[bin] * ratio[bin] * noise[bin] * curve[bin];
        signal[m_band[bin]] += (1.0f - m_share[bin]) * power;
        signal[m_band[bin] + 1u] += m_share[bin] * power;
    }
    // What spreads upwards loses 10 dB per Bark on its way, what spreads downwards 25.
    const auto perBand = [](double db) {
        return static_cast<float>(std::pow(10.0, -0.1 * db / kBandsPerBark));
    };
    const float up = perBand(10.0), down = perBand(25.0), offset = std::pow(10.0f, -0.1f * offsetDb);
    float spread = 0.0f;
    for (std::size_t band = 0; band < m_bands; ++band) threshold[band] = spread = spread * up + signal[band];
    spread = 0.0f;
    for (std::size_t band = m_bands; band-- > 0;) {
        threshold[band] += spread;
        spread = (spread + signal[band]) * down;
    }
    for (std::size_t band = 0; band < m_bands; ++band)
        threshold[band] *= offset / std::max(m_count[band], 1.0f);
    for (std::size_t bin = 0; bin < m_band.size(); ++bin) {
        const float masked =
            (1.0f - m_share[bin]) * threshold[m_band[bin]] + m_share[bin] * threshold[m_band[bin] + 1u];
        gain[bin] = std::max(gain[bin], std::min(std::sqrt(masked / (noise[bin] * curve[bin])), 1.0f));
    }
}

}  // namespace Corvo::DSP::Denoising

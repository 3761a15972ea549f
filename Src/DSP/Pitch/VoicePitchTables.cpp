#include "DSP/Pitch/VoicePitchTables.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <new>
#include <numbers>

#include "DSP/Parts/Correlation.h"

namespace Corvo::DSP {
namespace {

constexpr double kAnalysisRate = 24000.0;  // about the rate of what is transformed
constexpr double kFramePeriods = 2.2;      // length of a frame, in longest periods
constexpr int kFrameExtra = 32;
constexpr double kLeastOverlap = 0.25;

// The flattened spectrum: power^0.2 between these edges, less most of its mean over 400 Hz to either side.
constexpr double kFadeInHz = 30.0, kFadedInHz = 60.0, kFadeOutHz = 3500.0, kEndHz = 5000.0;
constexpr double kMeanHz = 400.0;

}  // namespace

VoicePitchTables::VoicePitchTables(double forRate, double forLowestHz)
    : rate(forRate),
      lowestHz(forLowestHz),
      decimation(std::max(static_cast<int>(std::lround(rate / kAnalysisRate)), 1)),
      analysisRate(rate / decimation),
      length(static_cast<int>(kFramePeriods * analysisRate / lowestHz) + kFrameExtra),
      lags(static_cast<int>(analysisRate / lowestHz) + 3),
      size(static_cast<int>(std::bit_ceil(static_cast<unsigned>(length + lags)))),
      meanBins(std::max(static_cast<int>(kMeanHz / (analysisRate / size)), 8)) {
    for (int i = 0; i < length; ++i)
        window.push_back(static_cast<float>(0.5 - 0.5 * std::cos(2.0 * std::numbers::pi * i / (length - 1))));
    const double whole = DotProduct(window.data(), window.data(), length);
    for (int lag = 0; lag < lags; ++lag)
        overlap.push_back(static_cast<float>(
            std::max(DotProduct(window.data(), window.data() + lag, length - lag) / whole, kLeastOverlap)));
    const double binHz = analysisRate / size;
    const int bins = std::min(static_cast<int>(kEndHz / binHz) + 1, size / 2);
    for (int bin = 0; bin < bins; ++bin) {
        const double in = (bin * binHz - kFadeInHz) / (kFadedInHz - kFadeInHz);
        const double out = (kEndHz - bin * binHz) / (kEndHz - kFadeOutHz);
        band.push_back(static_cast<float>(std::clamp(in, 0.0, 1.0) * std::clamp(out, 0.0, 1.0)));
    }
    m_plan = Fft::TakePlan<float>(static_cast<int>(std::bit_width(static_cast<unsigned>(size))) - 1,
                                  Fft::Kind::Real);
    if (!m_plan) throw std::bad_alloc();
}

}  // namespace Corvo::DSP

#include <algorithm>
#include <cmath>
#include <cstddef>

#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Scales/CoordinatesAndFrequencies.h"
#include "Spectrum/Scales/PixelBins.h"
#include "Spectrum/Scales/PowerToDecibels.h"

// From bins to the points of the curve: one point per pixel column, or two per band.

using Corvo::FrequencyScale;
using Corvo::LevelScale;

namespace {

constexpr float kWidest = 65536.0f;  // pixels

double ToLevel(double share, LevelScale scale) {
    switch (scale) {
        case LevelScale::Power:
            return share;
        case LevelScale::Amplitude:
            return std::sqrt(share);
        default:
            return 10.0 * std::log10(std::max(share, 1e-30));
    }
}

// Levels of all bins; `scale` turns power into a share of full scale.
void ToLevels(const std::vector<float>& power, std::vector<float>& levels, double scale,
              const CoordinatesAndFrequencies& map) {
    const auto factor = static_cast<float>(scale);
    switch (map.GetLevelScale()) {
        case LevelScale::Power:
            for (std::size_t k = 0; k < power.size(); ++k) levels[k] = power[k] * factor;
            break;
        case LevelScale::Amplitude:
            for (std::size_t k = 0; k < power.size(); ++k) levels[k] = std::sqrt(power[k] * factor);
            break;
        default: {
            Corvo::PowerToDecibels(power.data(), levels.data(), power.size(),
                                   static_cast<float>(10.0 * std::log10(scale)));
            const auto floor = static_cast<float>(map.GetFloor());
            for (float& level : levels) level = std::max(level, floor);
        }
    }
}

// Half the rate has no bin of its own. What its lobe leaves in the last ones, which rise towards it, would
// end the curve in a spike.
std::ptrdiff_t ShownBins(const std::vector<float>& power, const Corvo::SpectrumSettings& settings) {
    constexpr double kWidestLobe = 3.0;  // to either side, of all windows
    const auto bins = static_cast<std::ptrdiff_t>(power.size());
    const double fewest = std::max(static_cast<double>(bins) - kWidestLobe * Corvo::Padding(settings), 1.0);
    const float* end = power.data() + bins;
    while (static_cast<double>(end - power.data()) > fewest && end[-1] > end[-2]) --end;
    return end - power.data();
}

// The power between two frequencies, given in bins, a bin reaching half a step to either side.
double PowerBetween(const std::vector<float>& power, double low, double high) {
    const double last = static_cast<double>(power.size()) - 1.0;
    const auto first = static_cast<std::size_t>(std::clamp(std::floor(low + 0.5), 0.0, last));
    const auto end = static_cast<std::size_t>(std::clamp(std::floor(high + 0.5), 0.0, last));
    double sum = 0.0;
    for (std::size_t k = first; k <= end; ++k) {
        const double centre = static_cast<double>(k);
        const double share = std::min(high, centre + 0.5) - std::max(low, centre - 0.5);
        sum += std::max(share, 0.0) * power[k];
    }
    return sum;
}

}  // namespace

int SpectrumDrawer::ComputeSpectrumPoints(const Corvo::RectF& rectangle, Corvo::PointF* points, int& count,
                                          const CoordinatesAndFrequencies& map, Corvo::DisplayMode mode,
                                          int capacity, float offset, const std::vector<float>* other) {
    if (!other) AgePeaks();
    m_points.clear();
    m_pointBins.clear();
    const std::vector<float>& power = other ? *other : m_smoothed;
    const bool drawable = mode != Corvo::SpectrumDisplay::display_sonogram && m_samplingRate > 0 &&
                          !power.empty() && m_settings.fft_length > 0 && rectangle.width > 0.0f;
    if (drawable) {
        const double scale = static_cast<double>(m_settings.gain) * m_settings.gain *
                             std::pow(10.0, offset * 0.1) / Corvo::FullScalePower(m_settings);
        const bool bands = map.GetFrequencyScale() == FrequencyScale::Octaves ||
                           map.GetFrequencyScale() == FrequencyScale::ThirdOctaves;
        if (bands)
            AddBands(rectangle, map, power, scale / Corvo::NoiseBandwidth(m_settings));
        else
            AddCurve(rectangle, map, power, scale);
    }
    count = std::clamp(static_cast<int>(m_points.size()), 0, points ? std::max(capacity, 0) : 0);
    std::copy_n(m_points.begin(), count, points);
    return count;
}

void SpectrumDrawer::AddCurve(const Corvo::RectF& rectangle, const CoordinatesAndFrequencies& map,
                              const std::vector<float>& power, double scale) {
    m_levels.resize(power.size());
    ToLevels(power, m_levels, scale, map);
    const double perHz = static_cast<double>(m_settings.fft_length) / m_samplingRate;
    const auto bins = ShownBins(power, m_settings);
    const int columns = static_cast<int>(std::ceil(std::min(rectangle.width, kWidest)));
    const double left = rectangle.x, right = left + rectangle.width;
    double from = map.XToFrequency(left) * perHz;
    for (int column = 0; column < columns && from <= static_cast<double>(power.size()); ++column) {
        const double edge = std::min(left + column + 1.0, right);
        const double to = map.XToFrequency(edge) * perHz;
        const auto shown = Corvo::LevelOf(Corvo::BinsBetween(from, to, bins), m_levels.data(), bins);
        AddPoint((left + column + edge) / 2.0, map.LevelToY(shown.level), shown.bin);
        from = to;
    }
}

// A band is a step from its lower to its upper edge. Bands narrower than a column share one: its centre's.
void SpectrumDrawer::AddBands(const Corvo::RectF& rectangle, const CoordinatesAndFrequencies& map,
                              const std::vector<float>& power, double scale) {
    constexpr double kCentre = 1000.0;
    const double perOctave = map.GetFrequencyScale() == FrequencyScale::Octaves ? 1.0 : 3.0;
    const double perHz = static_cast<double>(m_settings.fft_length) / m_samplingRate;
    const double nyquist = m_samplingRate / 2.0;
    const auto edge = [&](double band) { return kCentre * std::exp2((band - 0.5) / perOctave); };
    const auto bandAt = [&](double x) {
        return std::floor(perOctave * std::log2(map.XToFrequency(x) / kCentre) + 0.5);
    };
    const double left = rectangle.x, right = left + rectangle.width;
    const int columns = static_cast<int>(std::ceil(std::min(rectangle.width, kWidest)));
    for (int column = 0; column < columns;) {
        const double band = bandAt(left + column + 0.5);
        if (edge(band) >= nyquist) break;
        int end = column + 1;
        while (end < columns && bandAt(left + end + 0.5) == band) ++end;
        const double share = scale * PowerBetween(power, edge(band) * perHz, edge(band + 1.0) * perHz);
        const double y = map.LevelToY(ToLevel(share, map.GetLevelScale()));
        const double centre = std::min(std::round(kCentre * std::exp2(band / perOctave) * perHz),
                                       static_cast<double>(power.size()) - 1.0);
        AddPoint(left + column, y, static_cast<std::ptrdiff_t>(centre));
        AddPoint(std::min(left + end, right), y, static_cast<std::ptrdiff_t>(centre));
        column = end;
    }
}

void SpectrumDrawer::AddPoint(double x, double y, std::ptrdiff_t bin) {
    m_points.push_back({static_cast<float>(x), static_cast<float>(y)});
    m_pointBins.push_back(static_cast<int>(bin));
}

const std::vector<Corvo::PointF>& SpectrumDrawer::GetXYPoints() const { return m_points; }
const std::vector<int>& SpectrumDrawer::GetFFTPoints() const { return m_pointBins; }

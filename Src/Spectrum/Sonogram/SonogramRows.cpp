#include "Spectrum/Sonogram/SonogramRows.h"

#include <algorithm>
#include <cmath>
#include <cstddef>

namespace Corvo {
namespace {

constexpr double kSamePlace = 0.01;  // of a row: what the mapping there and back may lose
constexpr PixelBins kNoBins{-1, -1, 0.0};

}  // namespace

CoordinatesAndFrequencies SonogramAxis::Map() const {
    const bool bands = scale == FrequencyScale::Octaves || scale == FrequencyScale::ThirdOctaves;
    return {{0.0f, 0.0f, static_cast<float>(height), 1.0f}, LowestShown(scale),   samplingRate / 2.0,
            bands ? FrequencyScale::Logarithmic : scale,    LevelScale::Decibels, 1.0f};
}

void SonogramRows::Prepare(const SonogramAxis& axis, int bins) {
    if (axis == m_axis && bins == m_bins) return;
    m_rows.resize(static_cast<std::size_t>(axis.height));
    m_axis = axis;
    m_bins = bins;
    const CoordinatesAndFrequencies map = axis.Map();
    const double perHz = 2.0 * bins / axis.samplingRate;
    double from = 0.0;
    for (int x = 0; x < axis.height; ++x) {
        const double to = std::max(map.XToFrequency(x + 1.0) * perHz, from);
        PixelBins& row = m_rows[static_cast<std::size_t>(axis.height - 1 - x)];
        row = from < bins ? BinsBetween(from, to, m_bins) : kNoBins;
        from = to;
    }
}

void SonogramRows::Levels(const float* levels, float* rows, float floor) const {
    for (const PixelBins& row : m_rows)
        *rows++ = row.first >= 0 ? static_cast<float>(LevelOf(row, levels, m_bins).level) : floor;
}

std::vector<RowRange> RowsWithin(const SonogramAxis& from, const SonogramAxis& to) {
    const CoordinatesAndFrequencies source = from.Map(), target = to.Map();
    const auto place = [&](double x) {
        return static_cast<double>(source.FrequencyToX(target.XToFrequency(x)));
    };
    const double top = from.height;
    std::vector<RowRange> rows(static_cast<std::size_t>(to.height));
    for (int x = 0; x < to.height; ++x) {
        const double low = place(x), high = place(x + 1.0);
        RowRange& row = rows[static_cast<std::size_t>(to.height - 1 - x)];
        row = {0, 0};
        if (high < kSamePlace || low > top - kSamePlace) continue;
        const double first = std::max(std::floor(low + kSamePlace), 0.0);
        const double end = std::clamp(std::ceil(high - kSamePlace), first + 1.0, top);
        row = {from.height - static_cast<int>(end), from.height - static_cast<int>(first)};
    }
    return rows;
}

}  // namespace Corvo

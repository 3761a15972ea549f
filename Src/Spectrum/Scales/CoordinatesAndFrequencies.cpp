#include "Spectrum/Scales/CoordinatesAndFrequencies.h"

#include <algorithm>
#include <cmath>

#include "Spectrum/Scales/EqualTemperament.h"

using Corvo::FrequencyScale;
using Corvo::LevelScale;

namespace {

constexpr double kLowestLogarithmic = 1.0;
constexpr double kMelCorner = 700.0;

constexpr double kHighest = 1e9, kLargestRange = 1000.0;

bool IsLogarithmic(FrequencyScale scale) {
    return scale != FrequencyScale::Linear && scale != FrequencyScale::Mel;
}

}  // namespace

CoordinatesAndFrequencies::CoordinatesAndFrequencies(const Corvo::RectF& rectangle, double lowest,
                                                     double highest, FrequencyScale frequencies,
                                                     LevelScale levels, float range)
    : m_rectangle(rectangle),
      m_frequencies(frequencies),
      m_levels(levels),
      // What is not a number becomes 0, what is out of reach the end of it.
      m_lowest(lowest > 0.0 ? std::min(lowest, kHighest) : 0.0),
      m_highest(highest > 0.0 ? std::min(highest, 2.0 * kHighest) : 0.0) {
    if (m_frequencies == FrequencyScale::Automatic)
        m_frequencies = m_highest < 4.0 * m_lowest ? FrequencyScale::Linear : FrequencyScale::Logarithmic;
    if (IsLogarithmic(m_frequencies)) m_lowest = std::max(m_lowest, kLowestLogarithmic);
    m_highest = std::max(m_highest, m_lowest + 1.0);
    if (m_frequencies == FrequencyScale::Notes) {
        m_lowest = Corvo::FrequencyOf(std::floor(Corvo::SemitoneOf(m_lowest) + 0.5) - 0.5);
        m_highest = Corvo::FrequencyOf(std::ceil(Corvo::SemitoneOf(m_highest) - 0.5) + 0.5);
    }
    m_left = Position(m_lowest);
    m_span = Position(m_highest) - m_left;
    const bool decibels = m_levels == LevelScale::Decibels;
    m_floor = decibels ? -(range > 1.0f ? std::min(static_cast<double>(range), kLargestRange) : 1.0) : 0.0;
    m_top = decibels ? 0.0 : 1.0;
}

const Corvo::RectF& CoordinatesAndFrequencies::GetRectangle() const { return m_rectangle; }
double CoordinatesAndFrequencies::GetLowest() const { return m_lowest; }
double CoordinatesAndFrequencies::GetHighest() const { return m_highest; }
FrequencyScale CoordinatesAndFrequencies::GetFrequencyScale() const { return m_frequencies; }
LevelScale CoordinatesAndFrequencies::GetLevelScale() const { return m_levels; }
double CoordinatesAndFrequencies::GetFloor() const { return m_floor; }

double CoordinatesAndFrequencies::Position(double frequency) const {
    if (IsLogarithmic(m_frequencies)) return std::log2(std::max(frequency, kLowestLogarithmic));
    if (m_frequencies == FrequencyScale::Mel) return std::log1p(std::max(frequency, 0.0) / kMelCorner);
    return frequency;
}

float CoordinatesAndFrequencies::FrequencyToX(double frequency) const {
    return static_cast<float>(m_rectangle.x + (Position(frequency) - m_left) / m_span * m_rectangle.width);
}

double CoordinatesAndFrequencies::XToFrequency(double x) const {
    if (!(m_rectangle.width > 0.0f)) return m_lowest;
    const double position = m_left + (x - m_rectangle.x) / m_rectangle.width * m_span;
    if (IsLogarithmic(m_frequencies)) return std::exp2(position);
    if (m_frequencies == FrequencyScale::Mel) return kMelCorner * std::expm1(position);
    return position;
}

float CoordinatesAndFrequencies::LevelToY(double level) const {
    const double share = (std::clamp(level, m_floor, m_top) - m_floor) / (m_top - m_floor);
    return static_cast<float>(m_rectangle.y + (1.0 - share) * m_rectangle.height);
}

double CoordinatesAndFrequencies::YToLevel(double y) const {
    if (!(m_rectangle.height > 0.0f)) return m_floor;
    const double share = 1.0 - (y - m_rectangle.y) / m_rectangle.height;
    return m_floor + share * (m_top - m_floor);
}

double Corvo::LowestShown(FrequencyScale scale) {
    constexpr double kLowestHeard = 20.0;
    return scale == FrequencyScale::Linear || scale == FrequencyScale::Mel ? 0.0 : kLowestHeard;
}

CoordinatesAndFrequencies Corvo::SpectrumMap(const RectF& rectangle, const SpectrumSettings& settings,
                                             int samplingRate) {
    const FrequencyScale scale = FrequencyScaleOf(settings);
    return {rectangle, LowestShown(scale),     samplingRate / 2.0,
            scale,     LevelScaleOf(settings), VerticalRangeOf(settings)};
}

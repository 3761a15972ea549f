#include "Drawing/Axis.h"

#include <algorithm>
#include <cmath>

#include "Drawing/ShortText.h"

namespace Corvo {
namespace {

constexpr double kConcertPitch = 440.0;
constexpr int kConcertSemitone = 69;
constexpr int kMostSteps = 400;  // of one scale, whatever its range

// "50", "1k", "2.5k".
ShortText FrequencyLabel(double hz) {
    ShortText text;
    const bool kilo = hz >= 1000.0;
    const double shown = kilo ? hz / 1000.0 : hz;
    const bool whole = std::abs(shown - std::round(shown)) < 0.005;
    const bool tenths = std::abs(shown * 10.0 - std::round(shown * 10.0)) < 0.05;
    return text.AddNumber(shown, whole ? 0 : tenths ? 1 : 2).Add(kilo ? "k" : "");
}

// The smallest of 1, 2 and 5 times a power of ten that is `least` or more.
double RoundStep(double least) {
    const double decade = std::pow(10.0, std::floor(std::log10(least)));
    for (const double factor : {1.0, 2.0, 5.0})
        if (factor * decade >= least * (1.0 - 1e-9)) return factor * decade;
    return 10.0 * decade;
}

// 1 to 9 times the powers of ten; 1, 2 and 5 get the labels, all do where less than a decade is in view.
void AddDecades(AxisTicks& ticks, const CoordinatesAndFrequencies& map, float unit) {
    const double low = std::max(map.GetLowest(), 1e-3), high = map.GetHighest();
    const bool close = high < 10.0 * low;
    for (double decade = std::pow(10.0, std::floor(std::log10(low))); decade <= high; decade *= 10.0)
        for (int digit = 1; digit <= 9; ++digit) {
            const double hz = digit * decade;
            if (hz < low || hz > high) continue;
            const int rank = digit == 1                 ? 0
                             : digit == 2 || digit == 5 ? 1
                             : close                    ? 2
                                                        : AxisTick::kUnlabelled;
            const bool dense = map.FrequencyToX(hz + decade) - map.FrequencyToX(hz) < unit;
            if (rank < AxisTick::kUnlabelled || !dense) ticks.Add(hz, rank, FrequencyLabel(hz).View());
        }
}

void AddSteps(AxisTicks& ticks, const CoordinatesAndFrequencies& map, float length, float unit) {
    constexpr double kUnitsPerLabel = 10.0;
    const double perPixel = (map.GetHighest() - map.GetLowest()) / std::max(length, 1.0f);
    const double step = RoundStep(perPixel * unit * kUnitsPerLabel);
    const double first = std::ceil(map.GetLowest() / step);
    for (int i = 0; i < kMostSteps; ++i) {
        const double hz = (first + i) * step;
        if (hz > map.GetHighest()) break;
        ticks.Add(hz, 0, FrequencyLabel(hz).View());
    }
}

// Lines: every semitone where there is room, else the naturals, else the Cs alone. Labels likewise, so that
// what is named does not change from octave to octave.
void AddNotes(AxisTicks& ticks, const CoordinatesAndFrequencies& map, float unit) {
    const float line = 1.6f * unit, label = 4.0f * unit;
    const auto hz = [](int semitone) {
        return kConcertPitch * std::exp2((semitone - kConcertSemitone) / 12.0);
    };
    const auto semitone = [](double frequency) {
        return kConcertSemitone + 12.0 * std::log2(std::max(frequency, 1.0) / kConcertPitch);
    };
    const int first = static_cast<int>(std::ceil(semitone(map.GetLowest())));
    const int last = static_cast<int>(std::floor(semitone(map.GetHighest())));
    for (int note = first; note <= last; ++note) {
        const int inOctave = (note % 12 + 12) % 12;
        const bool isNatural = (0b101010110101 >> inOctave & 1) != 0;
        const double step = map.FrequencyToX(hz(note + 1)) - map.FrequencyToX(hz(note));
        if (inOctave != 0 && (isNatural ? 1.5 * step : step) < line) continue;
        const int rank = inOctave == 0 ? 0 : isNatural ? 1 : 2;
        if (inOctave != 0 && step < label) {
            ticks.Add(hz(note), AxisTick::kUnlabelled, {});
            continue;
        }
        ticks.Add(hz(note), rank, ShortText().AddNoteName(note).View());
    }
}

}  // namespace

void AxisTicks::Add(double value, int rank, std::string_view label) {
    if (m_count == m_ticks.size()) return;
    AxisTick& tick = m_ticks[m_count++];
    tick.value = value;
    tick.rank = rank;
    std::copy_n(label.begin(), std::min(label.size(), tick.text.size() - 1), tick.text.begin());
}

AxisTicks FrequencyTicks(const CoordinatesAndFrequencies& map, float length, float unit, bool noteNames) {
    AxisTicks ticks;
    if (noteNames || map.GetFrequencyScale() == FrequencyScale::Notes)
        AddNotes(ticks, map, unit);
    else if (map.GetFrequencyScale() == FrequencyScale::Linear)
        AddSteps(ticks, map, length, unit);
    else
        AddDecades(ticks, map, unit);
    return ticks;
}

AxisTicks LevelTicks(const CoordinatesAndFrequencies& map, float length, float labelHeight) {
    AxisTicks ticks;
    const bool decibels = map.GetLevelScale() == LevelScale::Decibels;
    const double range = decibels ? -map.GetFloor() : 1.0;
    const double least = std::max(labelHeight, 1.0f) * range / std::max(length, 1.0f);
    const double step = RoundStep(least);
    for (int i = 0; i < kMostSteps; ++i) {
        const double level = (decibels ? 0.0 : 1.0) - i * step;
        if (level < (decibels ? map.GetFloor() : 0.0) - 1e-6) break;
        const int decimals = step >= 1.0 ? 0 : static_cast<int>(std::ceil(-std::log10(step) - 1e-9));
        ticks.Add(level, 0, ShortText().AddNumber(level, decimals).View());
    }
    return ticks;
}

AxisTicks TimeTicks(double seconds, float length, float labelWidth) {
    AxisTicks ticks;
    if (!(seconds > 0.0)) return ticks;
    const double step = RoundStep(seconds * std::max(labelWidth, 1.0f) / std::max(length, 1.0f));
    const int decimals = step >= 1.0 ? 0 : static_cast<int>(std::ceil(-std::log10(step) - 1e-9));
    ticks.Add(0.0, 0, "0 s");
    for (int i = 1; i < kMostSteps && i * step <= seconds; ++i)
        ticks.Add(-i * step, 0, ShortText().AddNumber(-i * step, decimals).View());
    return ticks;
}

bool LabelRoom::Take(float from, float to) {
    if (!(from >= m_first && to <= m_last) || m_count == m_taken.size()) return false;
    for (std::size_t i = 0; i < m_count; ++i)
        if (from < m_taken[i].to + m_gap && to > m_taken[i].from - m_gap) return false;
    m_taken[m_count++] = {from, to};
    return true;
}

}  // namespace Corvo

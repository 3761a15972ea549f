#include "Drawing/Views/Axis.h"

#include <algorithm>
#include <cmath>

#include "Drawing/Views/ShortText.h"
#include "Spectrum/Scales/EqualTemperament.h"

namespace Corvo {
namespace {

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

// 1 to 9 times the powers of ten. Every decade has the same labels, as many as fit between any two: 1 to 9
// where less than a decade is in view, else 1, 2 and 5, or 1 and 3, or 1.
void AddDecades(AxisTicks& ticks, const CoordinatesAndFrequencies& map, const AxisRoom& room) {
    const double low = map.GetLowest(), high = map.GetHighest();
    const auto xOf = [&](double hz) { return map.FrequencyToX(hz); };
    if (!(low > 0.0)) ticks.Add(0.0, 1, "0");
    const double first = low > 0.0 ? low : map.XToFrequency(xOf(0.0) + std::max(room.label, 1.0f));
    if (!(first > 0.0)) return;
    const bool close = high < 10.0 * first;
    for (double decade = std::pow(10.0, std::floor(std::log10(first))); decade <= high; decade *= 10.0) {
        const auto fits = [&](double from, double to) {
            return xOf(to * decade) - xOf(from * decade) >= room.label;
        };
        const bool fives = fits(1, 2) && fits(2, 5) && fits(5, 10), threes = fits(1, 3) && fits(3, 10);
        for (int digit = 1; digit <= 9; ++digit) {
            const double hz = digit * decade;
            if (hz < first * (1.0 - 1e-9) || hz > high) continue;
            int rank = AxisTick::kUnlabelled;
            if (digit == 1 && (threes || fives || fits(1, 10))) rank = 0;
            if (fives ? digit == 2 || digit == 5 : threes && digit == 3) rank = 1;
            if (rank == AxisTick::kUnlabelled && close) rank = 2;
            const bool dense = xOf(hz + decade) - xOf(hz) < room.line;
            if (rank < AxisTick::kUnlabelled || !dense) ticks.Add(hz, rank, FrequencyLabel(hz).View());
        }
    }
}

void AddSteps(AxisTicks& ticks, const CoordinatesAndFrequencies& map, const AxisRoom& room) {
    const double perPixel = (map.GetHighest() - map.GetLowest()) / std::max(room.length, 1.0f);
    const double step = RoundStep(perPixel * std::max(room.label, 1.0f));
    const double first = std::ceil(map.GetLowest() / step);
    for (int i = 0; i < kMostSteps; ++i) {
        const double hz = (first + i) * step;
        if (hz > map.GetHighest()) break;
        ticks.Add(hz, 1, FrequencyLabel(hz).View());
    }
}

// Lines: every semitone where there is room, else the naturals, else the Cs alone. Labels likewise, so that
// what is named does not change from octave to octave.
void AddNotes(AxisTicks& ticks, const CoordinatesAndFrequencies& map, const AxisRoom& room) {
    const float line = 1.6f * room.line;
    const int first = static_cast<int>(std::ceil(SemitoneOf(std::max(map.GetLowest(), 1.0))));
    const int last = static_cast<int>(std::floor(SemitoneOf(std::max(map.GetHighest(), 1.0))));
    for (int note = first; note <= last; ++note) {
        const int inOctave = (note % 12 + 12) % 12;
        const bool isNatural = (0b101010110101 >> inOctave & 1) != 0;
        const double step = map.FrequencyToX(FrequencyOf(note + 1)) - map.FrequencyToX(FrequencyOf(note));
        if (inOctave != 0 && (isNatural ? 1.5 * step : step) < line) continue;
        const int rank = inOctave == 0 ? 0 : isNatural ? 1 : 2;
        if (inOctave != 0 && step < room.label) {
            ticks.Add(FrequencyOf(note), AxisTick::kUnlabelled, {});
            continue;
        }
        ticks.Add(FrequencyOf(note), rank, ShortText().AddNoteName(note).View());
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

void AxisTicks::AddUnit(std::string_view unit, bool toTheLast) {
    for (std::size_t i = 0; i < m_count; ++i) {
        AxisTick& tick = m_ticks[toTheLast ? m_count - 1 - i : i];
        if (tick.rank >= AxisTick::kUnlabelled) continue;
        const ShortText text = ShortText().Add(tick.Label()).Add(unit);
        tick.text = {};
        std::copy_n(text.View().begin(), std::min(text.View().size(), tick.text.size() - 1),
                    tick.text.begin());
        tick.rank = 0;
        return;
    }
}

AxisTicks FrequencyTicks(const CoordinatesAndFrequencies& map, const AxisRoom& room, bool noteNames) {
    AxisTicks ticks;
    if (noteNames || map.GetFrequencyScale() == FrequencyScale::Notes) {
        AddNotes(ticks, map, room);
        return ticks;
    }
    if (map.GetFrequencyScale() == FrequencyScale::Linear)
        AddSteps(ticks, map, room);
    else
        AddDecades(ticks, map, room);
    ticks.AddUnit(" Hz", false);
    return ticks;
}

AxisTicks LevelTicks(const CoordinatesAndFrequencies& map, const AxisRoom& room) {
    AxisTicks ticks;
    const bool decibels = map.GetLevelScale() == LevelScale::Decibels;
    const double range = decibels ? -map.GetFloor() : 1.0;
    const double least = std::max(room.label, 1.0f) * range / std::max(room.length, 1.0f);
    double step = RoundStep(least);
    if (decibels)
        // Steps that the range is a multiple of, so that its lower end has a label.
        for (const double candidate : {1.0,  2.0,  3.0,  5.0,  6.0,  10.0, 12.0, 15.0, 20.0,  24.0,
                                       30.0, 36.0, 40.0, 45.0, 48.0, 60.0, 72.0, 90.0, 120.0, 144.0})
            if (candidate >= least && std::fmod(range, candidate) == 0.0) {
                step = candidate;
                break;
            }
    const int decimals = step >= 1.0 ? 0 : static_cast<int>(std::ceil(-std::log10(step) - 1e-9));
    for (int i = 0; i < kMostSteps; ++i) {
        const double level = (decibels ? 0.0 : 1.0) - i * step;
        if (level < (decibels ? map.GetFloor() : 0.0) - 1e-6) break;
        ticks.Add(level, i == 0 ? 0 : 1, ShortText().AddNumber(level, decimals).View());
    }
    if (decibels) ticks.AddUnit(" dB", false);
    return ticks;
}

AxisTicks TimeTicks(double last, double seconds, const AxisRoom& room) {
    AxisTicks ticks;
    if (!(seconds > 0.0) || !std::isfinite(last)) return ticks;
    const double step = RoundStep(seconds * std::max(room.label, 1.0f) / std::max(room.length, 1.0f));
    const int decimals = step >= 1.0 ? 0 : static_cast<int>(std::ceil(-std::log10(step) - 1e-9));
    const double first = std::ceil((last - seconds) / step - 1e-9);
    for (int i = 0; i < kMostSteps && (first + i) * step <= last + 1e-9 * step; ++i) {
        const double time = (first + i) * step;
        ticks.Add(time, 1, ShortText().AddNumber(time, decimals).View());
    }
    ticks.AddUnit(" s", true);
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

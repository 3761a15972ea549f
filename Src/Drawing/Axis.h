#pragma once

#include <array>
#include <cstddef>
#include <span>
#include <string_view>

#include "Spectrum/CoordinatesAndFrequencies.h"

namespace Corvo {

// One line of a scale. Rank 0 gets its label first, then 1 and 2, while there is room; a line of rank
// kUnlabelled has none.
struct AxisTick {
    static constexpr int kUnlabelled = 3;
    double value = 0.0;
    int rank = kUnlabelled;
    std::array<char, 16> text{};  // UTF-8, ended by a zero

    std::string_view Label() const { return text.data(); }
};

// The lines of a scale, lowest first.
class AxisTicks {
public:
    std::span<const AxisTick> All() const { return {m_ticks.data(), m_count}; }
    // Lines beyond the 192nd are left out.
    void Add(double value, int rank, std::string_view label);

private:
    std::array<AxisTick, 192> m_ticks{};
    std::size_t m_count = 0;
};

// Along a frequency scale of `length` pixels. `unit` is the least distance between two lines, in pixels;
// labelled ones of a linear scale are about ten times as far apart. With `noteNames` the lines are notes of
// the scale on A = 440 Hz instead of round frequencies, as they are on the note scale.
AxisTicks FrequencyTicks(const CoordinatesAndFrequencies& map, float length, float unit, bool noteNames);
// Along the level scale; labelled lines are at least `labelHeight` pixels apart.
AxisTicks LevelTicks(const CoordinatesAndFrequencies& map, float length, float labelHeight);
// Every so many seconds from 0 back to -seconds.
AxisTicks TimeTicks(double seconds, float length, float labelWidth);

// Keeps the labels of one scale apart: Take says whether from..to is free and within the scale, and takes it.
class LabelRoom {
public:
    LabelRoom(float first, float last, float gap) : m_first(first), m_last(last), m_gap(gap) {}
    bool Take(float from, float to);

private:
    struct Taken {
        float from, to;
    };
    float m_first, m_last, m_gap;
    std::array<Taken, 96> m_taken{};
    std::size_t m_count = 0;
};

}  // namespace Corvo

#pragma once

#include <array>
#include <cstddef>
#include <span>
#include <string_view>

#include "Spectrum/Scales/CoordinatesAndFrequencies.h"

namespace Corvo {

// One line of a scale. Rank 0 gets its label first, then 1 and 2, while there is room; a line of rank
// kUnlabelled has none.
struct AxisTick {
    static constexpr int kUnlabelled = 3;
    double value = 0.0;
    int rank = kUnlabelled;
    float at = 0.0f;              // the place of the value, x or y
    std::array<char, 16> text{};  // UTF-8, ended by a zero

    std::string_view Label() const { return text.data(); }
};

// The lines of a scale in its order. One label says what the unit is.
class AxisTicks {
public:
    std::span<const AxisTick> All() const { return {m_ticks.data(), m_count}; }
    // Lines beyond the 192nd are left out.
    void Add(double value, int rank, std::string_view label);
    // Appends the unit to the label of the first or the last line that has one, and gives it rank 0.
    void AddUnit(std::string_view unit, bool toTheLast);
    // Gives every line its place, at(value).
    template <typename At>
    void Place(At at) {
        for (std::size_t i = 0; i < m_count; ++i) m_ticks[i].at = at(m_ticks[i].value);
    }

private:
    std::array<AxisTick, 192> m_ticks{};
    std::size_t m_count = 0;
};

// What a scale has room for, in pixels: its length, the least distance between lines, and between labels.
struct AxisRoom {
    float length, line, label;
};

// With `noteNames` the lines are notes of the scale on A = 440 Hz instead of round frequencies, as they are
// on the note scale.
AxisTicks FrequencyTicks(const CoordinatesAndFrequencies& map, const AxisRoom& room, bool noteNames);
// From the top down; the lowest level of a decibel scale is one of them.
AxisTicks LevelTicks(const CoordinatesAndFrequencies& map, const AxisRoom& room);
// Round times within the `seconds` before `last`.
AxisTicks TimeTicks(double last, double seconds, const AxisRoom& room);

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

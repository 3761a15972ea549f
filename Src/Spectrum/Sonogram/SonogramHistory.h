#pragma once

#include <cstddef>
#include <cstdint>
#include <deque>
#include <utility>
#include <vector>

#include "Spectrum/Sonogram/PitchTrace.h"
#include "Spectrum/Sonogram/SonogramRows.h"

namespace Corvo {

// What a column of a sonogram was made for.
struct SonogramScale {
    SonogramAxis axis;
    float range;  // dB from silence to full scale
    int ticks;    // that a column lasts
    bool operator==(const SonogramScale&) const = default;
};

// Columns first..end-1 of a stretch.
struct ColumnRange {
    int first, end;
};

// Columns of one scale, one after the other.
struct SonogramStretch {
    static constexpr int kMostColumns = 128;

    SonogramScale scale;
    std::int64_t begin;                // tick
    std::vector<std::uint8_t> levels;  // 0 silence .. 255 full scale, column by column, top row first
    std::vector<float> pitches;        // one per column; 0 for none, below 0 what did not last

    int Columns() const { return static_cast<int>(pitches.size()); }
    std::int64_t End() const { return begin + std::int64_t{Columns()} * scale.ticks; }
    const std::uint8_t* Column(int index) const {
        return levels.data() + static_cast<std::ptrdiff_t>(index) * scale.axis.height;
    }
    // Those whose middle lies from `since` to before `to`, or else the one at the middle between them: of
    // equally long columns exactly one, wherever they begin.
    ColumnRange Within(std::int64_t since, std::int64_t to) const;
};

// What a sonogram has shown, as it was measured: each column keeps its rows, range and duration, so that
// another size or speed and back again loses nothing. The oldest columns go where it would take too much
// memory.
class SonogramHistory {
public:
    static constexpr int kTicksPerSecond = 900;  // a multiple of every speed
    static constexpr std::size_t kLeastLevels = std::size_t{1} << 24;

    // How many levels are kept at least, once they came.
    void Keep(std::size_t levels) { m_kept = levels > kLeastLevels ? levels : kLeastLevels; }
    // What the tuner hears at a refresh, 0 for nothing. Gives what columns that begin now are to keep of it:
    // less than 0 until it has lasted; then it is there from its beginning.
    float Hear(float hz);
    // The levels of a new column, to be filled by the caller. Allocates once for many of them; without memory
    // it throws std::bad_alloc; only the oldest columns may be gone.
    std::uint8_t* Add(const SonogramScale& scale, float pitch);
    // Time goes on from where it was.
    void Clear();
    // Nothing was heard for so many ticks.
    void Skip(std::int64_t ticks) {
        m_now += ticks;
        m_trace = {};
    }

    // The end of the newest column, and the beginning of the oldest, in ticks.
    std::int64_t Now() const { return m_now; }
    std::int64_t Oldest() const;
    const std::deque<SonogramStretch>& Stretches() const { return m_stretches; }

private:
    int Surplus() const;

    std::deque<SonogramStretch> m_stretches;
    PitchTrace m_trace;
    std::size_t m_levels = 0, m_kept = kLeastLevels;
    std::int64_t m_now = 0;
};

}  // namespace Corvo

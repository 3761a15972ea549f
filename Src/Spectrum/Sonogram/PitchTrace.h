#pragma once

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <optional>
#include <utility>

namespace Corvo {

// Which of the pitches that a tuner hears at the display's refreshes are worth a line: those of notes that
// last. Many a drum is heard as a note for a moment, and many a note as its octave.
class PitchTrace {
public:
    static constexpr int kRefreshesPerSecond = 30;
    static constexpr float kLargestStep = 1.09f;  // one and a half semitones at once are another note
    static constexpr int kLongestGap = 3;         // refreshes that a note may go unheard

    // At every refresh, `hz` being 0 for nothing. `now` counts time. Since when the pitch has been part of a
    // line; nothing while that is not sure.
    std::optional<std::int64_t> Hear(float hz, std::int64_t now) {
        m_line.Wait();
        m_next.Wait();
        if (!(hz > 0.0f)) return std::nullopt;
        if (m_line.GoesOnWith(hz)) {
            m_line.Add(hz);
            m_next = {};
            return now;
        }
        if (!m_next.GoesOnWith(hz)) {
            const bool octave = m_line.unheard <= kLongestGap + 1 && AreOctave(hz, m_line.hz);
            m_next = {.begin = now, .needed = octave ? kLeastOfOctave : kLeast};
        }
        m_next.Add(hz);
        if (m_next.heard < m_next.needed) return std::nullopt;
        m_line = std::exchange(m_next, {});
        return m_line.begin;
    }

private:
    static constexpr int kLeast = 4, kLeastOfOctave = 8;  // refreshes

    struct Run {
        float hz = 0.0f;  // last
        int heard = 0, unheard = 0;
        std::int64_t begin = 0;
        int needed = 0;

        bool GoesOnWith(float next) const {
            return heard > 0 && unheard <= kLongestGap + 1 && next <= hz * kLargestStep &&
                   hz <= next * kLargestStep;
        }
        // Counted as far as it matters.
        void Wait() { unheard = std::min(unheard + 1, kLongestGap + 2); }
        void Add(float next) {
            hz = next;
            heard = std::min(heard + 1, kLeastOfOctave);
            unheard = 0;
        }
    };
    static bool AreOctave(float hz, float other) {
        constexpr float kTolerance = 0.05f;  // octaves
        return std::abs(std::abs(std::log2(hz / other)) - 1.0f) < kTolerance;
    }

    Run m_line, m_next;
};

}  // namespace Corvo

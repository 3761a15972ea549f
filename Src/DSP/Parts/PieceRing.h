#pragma once

#include <algorithm>

namespace Corvo::DSP {

// A delay line read and written in pieces of up to kPiece samples that are contiguous wherever they start:
// behind the end of the ring its first samples are repeated. A piece may not be longer than the ring.
template <typename T>
class PieceRing {
public:
    static constexpr int kPiece = 64;

    // Cells that a ring of `length` needs.
    static constexpr int Cells(int length) { return length + kPiece; }
    void Use(T* cells) {
        m_cells = cells;
        m_length = -1;
    }
    // Cleared when the length is another one than before.
    void SetLength(int length) {
        if (length == m_length) return;
        m_length = length;
        Clear();
    }
    void Clear() {
        std::fill_n(m_cells, Cells(m_length), T(0));
        m_position = 0;
    }

    // The oldest samples; writing them and advancing makes them the newest.
    T* Here() { return m_cells + m_position; }
    void Advance(int count) {
        const int end = m_position + count;
        if (end > m_length) std::copy(m_cells + m_length, m_cells + end, m_cells);
        if (m_position < kPiece)
            std::copy(m_cells + m_position, m_cells + std::min(end, kPiece), m_cells + m_length + m_position);
        m_position = end >= m_length ? end - m_length : end;
    }
    // From the sample that was written `delay` samples ago, 1..length.
    const T* Before(int delay) const {
        const int at = m_position - delay;
        return m_cells + (at < 0 ? at + m_length : at);
    }

private:
    T* m_cells = nullptr;
    int m_length = -1, m_position = 0;
};

}  // namespace Corvo::DSP

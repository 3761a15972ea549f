#pragma once

#include <algorithm>
#include <array>

namespace Corvo::DSP {

// A delay line read and written in pieces of up to Piece samples that are contiguous wherever they start:
// behind the end of the ring its first samples are repeated. A piece may not be longer than the ring.
//
// It takes memory as it comes, and clearing it writes nothing: until the ring has been filled once, what was
// never written counts as 0. So a long line costs nothing before it is used, and a page of it is touched when
// the sound gets there.
template <typename T, int Piece = 64>
class PieceRing {
public:
    static constexpr int kPiece = Piece;

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
        m_position = 0;
        m_full = false;
    }

    // The `count` oldest samples, made 0 where there were none yet; writing them and advancing makes them the
    // newest.
    T* MakeReady(int count) {
        T* const oldest = m_cells + m_position;
        if (!m_full) std::fill_n(oldest, std::min(count, m_length - m_position), T(0));
        return oldest;
    }
    void Advance(int count) {
        const int end = m_position + count;
        if (end > m_length) std::copy(m_cells + m_length, m_cells + end, m_cells);
        if (m_position < kPiece)
            std::copy(m_cells + m_position, m_cells + std::min(end, kPiece), m_cells + m_length + m_position);
        m_full = m_full || end >= m_length;
        m_position = end >= m_length ? end - m_length : end;
    }

    // For a line that is only written here and read elsewhere: where a piece goes before the ring advances.
    // What was written there stays until it is the oldest.
    T* Space() {
        // A piece may begin before the first sample.
        if (!m_full && m_position == 0) std::fill_n(m_cells + m_length - kPiece, kPiece, T(0));
        return m_cells + m_position;
    }
    void Push(const T* samples, int count) {
        std::copy_n(samples, count, Space());
        Advance(count);
    }
    // `count` samples that were pushed one after the other, the first of them `delay` ago, 1..length. The
    // ring is at least a piece long.
    const T* Before(int delay, int count) const {
        static constexpr std::array<T, kPiece> kNothing{};
        if (!m_full && delay - count >= m_position) return kNothing.data();
        const int at = m_position - delay;
        return m_cells + (at < 0 ? at + m_length : at);
    }

    // Where the sample is that will be the oldest in `frames`, less than a length, or was it -`frames` ago:
    // to ask for memory beforehand.
    const T* Ahead(int frames) const {
        const int at = m_position + frames;
        return m_cells + (at < 0 ? at + m_length : at < m_length ? at : at - m_length);
    }
    int Length() const { return m_length; }

private:
    T* m_cells = nullptr;
    int m_length = -1, m_position = 0;
    bool m_full = false;
};

}  // namespace Corvo::DSP

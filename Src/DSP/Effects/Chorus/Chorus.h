#pragma once

#include <array>
#include <cstdint>
#include <memory>

#include "DSP/Effects/Framework/CorvoEffect.h"

namespace Corvo::DSP {

namespace ChorusPrivate {

// The settings, the chunk after its first word, and a row of the preset table; pairs are left, right.
struct _transform_props {
    // Left, right.
    using Pair = std::array<std::int32_t, 2>;
    Pair frequency;  // of the sweep, 0..300 hundredths of a hertz
    Pair delay;      // the longest, 0..10000 tenths of a millisecond
    Pair wet;        // -960..100 tenths of dB, silent at -960
    Pair dry;        // -960..100 tenths of dB, silent at -960
    Pair depth;      // 0..1000 thousandths of the delay
    // Kept.
    std::array<std::int32_t, 12> reserved;
};
static_assert(sizeof(_transform_props) == 88);

struct Delay;

}  // namespace ChorusPrivate

// Chorus and flanger: per side a delay that a sine sweeps, mixed with the dry signal. No feedback.
//
// The delay heard is delay * (1 - depth) when the sine is at its lowest and delay * (1 - 2 depth) when it is
// at its highest; the way between is rounded down to a whole even number of frames. The ring is as long as
// the delay, so that beyond half depth, where that falls below 0, the delay goes on from its longest; at full
// depth it runs from the whole ring down to nothing. Cf. J. Dattorro, "Effect Design, Part 2: Delay-Line
// Modulation and Chorus", J. Audio Eng. Soc. 45 (1997).
//
// Blocks are interleaved, mono or stereo; 64-bit samples are double, every other width is taken for float.
// The delay lines hold floats, of what is beyond them the largest. Channels after the second pass unchanged,
// and so does everything when there was no memory for the ring. No latency.
//
// Memory: InitProcessing makes a ring for 10 s and touches none of it; until the sound has been through what
// the settings use, each block touches as much as it writes. Settings from a chunk beyond that, or beyond the
// ring when the format changed without InitProcessing, are limited to what the ring holds. The ring keeps its
// contents through edits and preparation.
//
// Settings chunk: 92 bytes, the chunk tag and the settings, 22 words; the oldest layout has 180 bytes.
class DSP_API Chorus : public CorvoEffect {
public:
    Chorus();
    ~Chorus() override;
    using CorvoEffect::FitsOldChunk;

    void CheckCookProperties(const tWAVEFORMATEX* format, bool force) override;
    void Cleanup() override;                             // frees the ring; the next cook makes a new one
    void InitResetProcessingLight(bool reset) override;  // clears the ring, whatever `reset`

protected:
    void ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                         ProcessFlags& flags) override;

private:
    int Channels() const;
    bool InitState(const ChorusPrivate::_transform_props& settings, bool reset);
    bool MakeRing();

    ChorusPrivate::_transform_props m_settings{};  // shared between the threads
    tWAVEFORMATEX m_format{};
    std::unique_ptr<ChorusPrivate::Delay> m_delay;
    std::unique_ptr<float[]> m_ring;
    int m_capacity = 0;     // floats
    int m_ring_length = 0;  // samples, all channels counted
    std::array<int, 2> m_tail_left{};
};

}  // namespace Corvo::DSP

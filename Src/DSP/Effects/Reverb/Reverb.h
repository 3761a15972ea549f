#pragma once

#include <array>
#include <cstdint>
#include <memory>

#include "DSP/Effects/Framework/CorvoEffect.h"

namespace Corvo::DSP {

namespace ReverbPrivate {

// The settings, the chunk after its first word, and a row of the preset table; pairs are left, right.
struct _transform_props {
    // Left, right.
    using Pair = std::array<std::int32_t, 2>;
    Pair preDelay;     // 0..2000, times 0.1 ms
    Pair mix;          // 0..2000; times 0.0005 the reflections' share of the wet sound
    Pair length;       // 0..10000 ms
    Pair wet;          // -450..100 tenths of dB, silent at -450
    Pair dry;          // the same
    Pair damping;      // 0..2500; the left one serves both sides
    Pair reflections;  // 0..5000, times 0.001 the size of the pattern
    Pair room;         // 1..4000, times 0.001
    // Kept.
    std::int32_t reserved;
    std::int32_t filterOff;  // other than 0: no filter against offsets; no parameter sets it
};
static_assert(sizeof(_transform_props) == 72);

}  // namespace ReverbPrivate

// Reverberator: per channel a high-pass at 10 Hz, 19 early reflections, six damped combs fed by them and
// an all-pass, after M. R. Schroeder, "Natural Sounding Artificial Reverberation", J. Audio Eng. Soc. 10
// (1962), and J. A. Moorer, "About This Reverberation Business", Computer Music Journal 3 (1979).
//
// Blocks are interleaved or planar, mono or stereo, 32- or 64-bit float; any other width passes unchanged,
// and so do channels after the second, and everything when there was no memory. 32-bit blocks are computed
// in single precision, except for the input filter. No latency.
//
// Parameters come in pairs, left and right; external indices run backwards: external 0 is real 15.
//
// Memory: InitProcessing makes the largest buffers for its format, without touching them: a page is touched
// by the block whose sound first gets there. A format that was not announced makes its own in the first block
// that has it. An edit that changes the length of a buffer clears it.
//
// Settings chunk: 76 bytes, the chunk tag and the settings, 18 words; the oldest layout has 148 bytes.
class DSP_API Reverb : public CorvoEffect {
public:
    Reverb();
    ~Reverb() override;
    using CorvoEffect::FitsOldChunk;

    bool SupportsNoninterleaved() override;
    void CheckCookProperties(const tWAVEFORMATEX* format, bool force) override;
    void Cleanup() override;  // frees the buffers; the next cook makes new ones
    void ClearMemory();       // clears buffers, combs and filters; on the audio thread, between blocks

protected:
    void ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                         ProcessFlags& flags) override;
    void ProcessInternalNoninterleaved(double* const* channels, int frames, const tWAVEFORMATEX* format,
                                       ProcessFlags& flags) override;

private:
    struct Engines;

    void InitState(bool reset);

    ReverbPrivate::_transform_props m_settings{};  // shared between the threads
    tWAVEFORMATEX m_format{};
    std::unique_ptr<Engines> m_engines;
};

}  // namespace Corvo::DSP

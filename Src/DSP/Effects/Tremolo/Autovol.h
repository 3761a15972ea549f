#pragma once

#include <array>
#include <cstdint>
#include <memory>

#include "DSP/Effects/Framework/CorvoEffect.h"

namespace Corvo::DSP {

namespace AutovolPrivate {

// The settings, the chunk after its first word, and a row of the preset table; pairs are left, right.
struct _transform_props {
    // Left, right.
    using Pair = std::array<std::int32_t, 2>;
    Pair depth;    // 0..1000 tenths of a percent
    Pair mix;      // 0..1000 tenths of a percent, ring modulation only
    Pair rate;     // 0..3000 hundredths of a hertz
    Pair ringMod;  // 1: the oscillator multiplies the signal; set by presets and chunks only
    Pair invert;   // 1: the other polarity
    std::array<std::int32_t, 8> reserved;  // kept
    Pair outGain;                          // -960..200 tenths of dB, silent at -960
    Pair reserved2;                        // kept
};
static_assert(sizeof(_transform_props) == 88);

struct Side;

}  // namespace AutovolPrivate

// Tremolo and auto-pan: a sine oscillator per side moves the level of that side, between
// (1 - depth) / (1 + depth) and 1. In ring modulation it multiplies the signal by mix * sine + (1 - mix).
//
// Blocks are interleaved, mono or stereo; 64-bit samples are double, every other width is taken for float.
// Channels after the second pass unchanged. No latency. The oscillators run on through parameter changes;
// InitProcessing starts both from 0.
//
// Settings chunk: 92 bytes, the chunk tag and the settings, 22 words; the oldest layout has 180 bytes.
class DSP_API Autovol : public CorvoEffect {
public:
    Autovol();
    ~Autovol() override;
    using CorvoEffect::FitsOldChunk;

    void CheckCookProperties(const tWAVEFORMATEX* format, bool force) override;

protected:
    void ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                         ProcessFlags& flags) override;

private:
    void InitState(const AutovolPrivate::_transform_props& settings, const tWAVEFORMATEX& format, bool force);

    AutovolPrivate::_transform_props m_settings{};  // shared between the threads
    tWAVEFORMATEX m_format{};
    std::unique_ptr<std::array<AutovolPrivate::Side, 2>> m_sides;
};

}  // namespace Corvo::DSP

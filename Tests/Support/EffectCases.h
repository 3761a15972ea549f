#pragma once

#include <memory>
#include <span>

#include "DSP/Effects/EffectKinds.h"

namespace TestSupport {

// How the output may depend on the way a stream is cut into blocks.
enum class Cuts {
    SameBits,
    PhasePerBlock,  // an oscillator's phase is reduced per block: 1e-12 in double, one rounding in float
    Exempt,         // the engine behind it works in pieces of its own
};

// One row per effect; every suite over all effects, the comparison with the Windows build and the
// benchmarks read this table. A new effect is one line in EffectCases.cpp.
struct EffectCase {
    const char* name;
    const char* kind = name;  // to the library
    Cuts cuts = Cuts::SameBits;
    // The engine's splices are choices between near equals, which another build may make otherwise.
    bool splices = false;
    // The engine behind the effect allocates or locks while processing; says why.
    const char* engineAllocates = nullptr;
    // Some settings have a loop gain of 1 or more, so the output may grow without bound.
    bool mayGrow = false;
    // No input makes the output overflow.
    bool bounded = false;
    // Parameters that move together on purpose: setting a parameter may change others of its group.
    bool linkedParameters = false;
    // The shortest older layout that is still taken, in bytes; below it, and below today's, nothing changes.
    std::size_t shortestChunk = SIZE_MAX;
    // Parameters are kept as plain floats rather than words, so a round trip may be off by a rounding.
    bool plainFloats = false;
    // A sweep's phase runs on through preparation, so a used instance sounds unlike a new one.
    bool phaseRunsOn = false;
    // Texts are truncated, so text -> value -> text may lose one unit of the last place.
    bool textTruncates = false;
    // A switch that a loaded chunk always leaves off.
    int loadsOff = -1;

    std::unique_ptr<Corvo::DSP::CorvoEffectBase> Make() const {
        return Corvo::DSP::FindEffectKind(kind)->make();
    }
};

std::span<const EffectCase> AllEffects();

}  // namespace TestSupport

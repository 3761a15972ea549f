#pragma once

#include <array>
#include <memory>

#include "DSP/Effects/Denoiser/BinTables.h"
#include "DSP/Effects/Denoiser/SizeSets.h"
#include "DSP/Effects/Denoiser/TrackerTables.h"

namespace Corvo::DSP::Denoising {

constexpr std::size_t kLengths = kLearnedLengths.size();
constexpr std::size_t kBlendIndex = 1, kTrackIndex = 3;
static_assert(kLearnedLengths[kBlendIndex] == kBlendLength && kLearnedLengths[kTrackIndex] == kTrackLength);

constexpr std::size_t kResponseBins = 3;  // of a frequency response: of its window's own, to either side

// Windows of one length.
struct WindowShape {
    void Prepare(int samples);

    int length = 0;
    Floats analysis, synthesis;  // square roots of a Hann window; the second sums to one over the overlap
};

// What all reducers at one rate have in common; never changes once made.
struct ReducerTables {
    // Allocates; throws std::bad_alloc.
    explicit ReducerTables(double rate);
    bool IsFor(double otherRate) const { return otherRate == rate; }

    const double rate;
    const Scale scale;
    std::array<WindowShape, kLengths> shapes;
    std::array<BinTables, kLengths> bins;
    std::array<Floats, kLengths> responses;  // of each length, to a spectrum of the tracker's
    TrackerTables tracker;

private:
    Arena m_memory;
};

// The tables for a rate: those another reducer has, or new ones. The last reducer that has them frees them.
// May wait for another thread that makes some. Throws std::bad_alloc.
std::shared_ptr<const ReducerTables> TablesFor(double rate);

}  // namespace Corvo::DSP::Denoising

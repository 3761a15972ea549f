#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "DSP/Effects/Denoiser/Rings.h"

namespace Corvo::DSP::Denoising {

// A third of an octave of the tracker's spectrum, at least 12 bins; each covers half of the next.
struct TrackerBand {
    std::size_t first, end;  // bins
    std::size_t quiet;       // how many of them make the lower half
    float logCentre;
    float whiteLevel;     // what the quiet half of white noise comes to, of its whole
    float whiteFlatness;  // mean of its logarithms less the logarithm of its mean
    std::size_t below;    // the bin below the centre, and the share of the next one
    float share;
};

// What the trackers of all channels share; made before processing.
struct TrackerTables {
    // For spectra of so many bins. Allocates.
    void Prepare(std::size_t bins);

    std::vector<TrackerBand> bands;
    static constexpr std::size_t kGroups = 4;
    std::array<std::size_t, kGroups + 1> groups{};  // of bands with about the same work; where they begin
    std::vector<std::uint16_t> bandBelow;           // per bin: the band whose centre is at or below it
    Floats bandShare;                               // of the next band
    std::size_t belowFirst = 0;                     // bins below the first band's centre
    Floats logBin;
};

}  // namespace Corvo::DSP::Denoising

#pragma once

#include <array>
#include <cstddef>
#include <span>

#include "Spectrum/Tuner/PitchPeaks.h"

namespace Corvo {

// Fundamentals, in bins, that would explain the strongest peaks as one of their first partials.
class PitchCandidates {
public:
    void FindMultipleFrequencies(std::span<const SpectralPeak> peaks, double lowest, double highest);
    const double* begin() const { return m_bins.data(); }
    const double* end() const { return m_bins.data() + m_count; }

private:
    static constexpr std::size_t kPeaks = 6, kDivisors = 12;
    std::array<double, kPeaks * kDivisors> m_bins;
    std::size_t m_count = 0;
};

// Which partial of `fundamental` a peak is, 0 for none, and how much that says: towards 1 the better it fits
// and the less it would by chance, 0 at the edge of what is taken. Partials may be stretched as a string's
// are.
struct PartialFit {
    int number;
    float fit;
};
PartialFit FitPartial(double fundamental, double position);

// How well `fundamental` (bins) explains the peaks: the share of their weights that its partials have, less
// for partials that ought to lie below one and are missing. 0 .. 1.
float HarmonicMatching(std::span<const SpectralPeak> peaks, double fundamental);

// The frequency, in bins, of the first partial of the sound whose fundamental is about `fundamental`: the
// best weighted fit of partials f_n = n f sqrt(1 + B n^2), B small, to the peaks that belong to it. As given,
// when none does or the fit explains the peaks less well.
double RefineFundamental(std::span<const SpectralPeak> peaks, double fundamental);

}  // namespace Corvo

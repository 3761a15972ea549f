#pragma once

#include <cstddef>
#include <vector>

#include "Platform/Export.h"

// A moving average over the last few spectra: a ring of spectra and a weight for every age. The weights are a
// raised cosine, the same forwards and backwards, and sum to 1. One thread at a time. Resize allocates;
// Average passes over all spectra.
class DSP_API VectorInterpolationFilterFloat {
public:
    VectorInterpolationFilterFloat();
    ~VectorInterpolationFilterFloat();

    // Room for `spectra` spectra of `bins` values, all zero; 0 or less empties the filter.
    void Resize(int spectra, int bins);
    // How many spectra it averages.
    int GetSpectra() const;

    // Stores `newest` as the current spectrum, writes the weighted sum of all into `average` and moves on.
    // Works on as many bins as both vectors and the filter have; an empty filter does nothing.
    void Average(const std::vector<float>& newest, std::vector<float>& average);

private:
    std::vector<float> m_weights;  // by age, the newest first
    std::vector<float> m_ring;
    std::size_t m_bins = 0;
    std::size_t m_current = 0;
};

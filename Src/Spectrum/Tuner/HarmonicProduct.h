#pragma once

#include <cstddef>
#include <span>
#include <vector>

namespace Corvo {

// The product of a power spectrum with its own compressions by 2, 3 .. : large where there is a fundamental
// with all its overtones.
class HarmonicProduct {
public:
    // product[k] = spectrum[k] * spectrum[2k] * ... * spectrum[harmonics k], as long as the spectrum reaches.
    // An overtone counts half when `halve` is set, and as 1 at least, so that a missing one does not wipe out
    // a candidate; the fundamental counts as it is. Allocates only when its length changes.
    void HarmonicProductSepctrumComputation(std::span<const float> spectrum, int harmonics, bool halve);

    // The bin of the maximum of start .. end - 1 that stands at least `limit` dB above the geometric mean of
    // the valleys beside it, the lowest of equals, and how far it stands above them. -1 and 0 when it stands
    // lower, lacks a valley or is not a number; bins outside the product are not searched.
    int SearchMaximunInRange(int start, int end, double limit, double& prominence) const;

    const std::vector<double>& Values() const { return m_product; }

private:
    std::vector<double> m_product;
};

}  // namespace Corvo

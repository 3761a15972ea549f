#pragma once

#include <vector>

#include "Spectrum/Scales/CoordinatesAndFrequencies.h"
#include "Spectrum/Scales/PixelBins.h"

namespace Corvo {

// Everything that says which frequency lies in which row of a sonogram.
struct SonogramAxis {
    int height;
    int samplingRate;  // Hz
    FrequencyScale scale;
    bool operator==(const SonogramAxis&) const = default;

    // x runs upwards from the lower edge of the lowest row, 0..height. From 0 Hz (linear, mel) or 20 Hz to
    // half the sampling rate; bands have a logarithmic axis.
    CoordinatesAndFrequencies Map() const;
};

// The rows of a spectrum's column, the highest frequency first. Each bin falls to exactly one row: those
// below the axis to the lowest. Worked out once for an axis and a number of bins.
class SonogramRows {
public:
    void Prepare(const SonogramAxis& axis, int bins);
    // `levels` has `bins` entries, `rows` the axis' height; a row without frequencies gets `floor`.
    void Levels(const float* levels, float* rows, float floor) const;

private:
    SonogramAxis m_axis{};
    std::ptrdiff_t m_bins = 0;
    std::vector<PixelBins> m_rows;
};

// For each row of a picture with the axis `to` the rows first..end-1 of the axis `from` that lie in it, at
// least one; none where `from` does not reach.
struct RowRange {
    int first, end;
};
std::vector<RowRange> RowsWithin(const SonogramAxis& from, const SonogramAxis& to);

}  // namespace Corvo

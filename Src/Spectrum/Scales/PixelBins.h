#pragma once

#include <cstddef>

namespace Corvo {

// What one pixel of a frequency axis shows: the highest of the bins between its edges or, where bins lie
// further apart than pixels, a curve that passes smoothly from one to the next without leaving the range
// between them.
struct PixelBins {
    std::ptrdiff_t first, end;  // the bins between its edges; none when equal
    double middle;              // in bins, where the curve is read then
};

struct PixelLevel {
    double level;
    std::ptrdiff_t bin;  // the one that is shown, or the nearest
};

// Edges are in bins, `from` <= `to`; of pixels side by side each bin falls to exactly one. `bins` is at least
// 1, and so is what the levels count.
PixelBins BinsBetween(double from, double to, std::ptrdiff_t bins);
PixelLevel LevelOf(const PixelBins& pixel, const float* levels, std::ptrdiff_t bins);

}  // namespace Corvo

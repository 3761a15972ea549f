#include "Spectrum/Scales/PixelBins.h"

#include <algorithm>
#include <cmath>

namespace Corvo {
namespace {

// Through the middle two of four levels, without ever leaving the range between them.
double Between(double before, double from, double to, double after, double share) {
    const auto slope = [](double left, double right) {
        return left * right > 0.0 ? 2.0 * left * right / (left + right) : 0.0;
    };
    const double step = to - from;
    const double atFrom = slope(from - before, step), atTo = slope(step, after - to);
    const double s = share, s2 = s * s, s3 = s2 * s;
    return from + step * (3.0 * s2 - 2.0 * s3) + atFrom * (s3 - 2.0 * s2 + s) + atTo * (s3 - s2);
}

}  // namespace

PixelBins BinsBetween(double from, double to, std::ptrdiff_t bins) {
    const auto count = static_cast<double>(bins);
    return {static_cast<std::ptrdiff_t>(std::ceil(std::clamp(from, 0.0, count))),
            static_cast<std::ptrdiff_t>(std::ceil(std::clamp(to, 0.0, count))),
            std::clamp((from + to) / 2.0, 0.0, count - 1.0)};
}

PixelLevel LevelOf(const PixelBins& pixel, const float* levels, std::ptrdiff_t bins) {
    if (pixel.first < pixel.end) {
        const float* const highest = std::max_element(levels + pixel.first, levels + pixel.end);
        return {*highest, highest - levels};
    }
    const auto level = [&](std::ptrdiff_t k) {
        return static_cast<double>(levels[std::clamp<std::ptrdiff_t>(k, 0, bins - 1)]);
    };
    const auto below = static_cast<std::ptrdiff_t>(pixel.middle);
    const double share = pixel.middle - static_cast<double>(below);
    return {Between(level(below - 1), level(below), level(below + 1), level(below + 2), share),
            share < 0.5 ? below : std::min(below + 1, bins - 1)};
}

}  // namespace Corvo

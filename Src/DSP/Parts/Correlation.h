#pragma once

#include <algorithm>
#include <cstddef>
#include <xsimd/xsimd.hpp>

namespace Corvo::DSP {

// Sum of products. The order of the additions is fixed, so that every processor gives the same bits.
inline double DotProduct(const float* a, const float* b, std::ptrdiff_t count) {
    using Batch = xsimd::make_sized_batch_t<float, 4>;
    constexpr std::ptrdiff_t kLanes = 4, kSums = 4;
    Batch sums[kSums] = {Batch(0.0f), Batch(0.0f), Batch(0.0f), Batch(0.0f)};
    std::ptrdiff_t i = 0;
    for (; i + kSums * kLanes <= count; i += kSums * kLanes)
        for (std::ptrdiff_t s = 0; s < kSums; ++s)
            sums[s] += Batch::load_unaligned(a + i + s * kLanes) * Batch::load_unaligned(b + i + s * kLanes);
    float lanes[kLanes];
    ((sums[0] + sums[1]) + (sums[2] + sums[3])).store_unaligned(lanes);
    double sum = (static_cast<double>(lanes[0]) + static_cast<double>(lanes[1])) +
                 (static_cast<double>(lanes[2]) + static_cast<double>(lanes[3]));
    for (; i < count; ++i) sum += static_cast<double>(a[i] * b[i]);
    return sum;
}

// The top of the parabola through three neighbouring values, as an offset from the middle one (-0.5..0.5 for
// a maximum), and its height.
struct ParabolaTop {
    double offset = 0.0, height;

    ParabolaTop(double before, double middle, double after) : height(middle) {
        const double bend = before - 2.0 * middle + after;
        if (bend >= 0.0) return;
        offset = 0.5 * (before - after) / bend;
        height = middle - 0.25 * (before - after) * offset;
    }
};

// The place of the largest value(i), first <= i <= last, between the whole places: found in steps of `step`,
// which must be shorter than a peak, then by ones. `inside` is false when it is the first or the last place,
// which may lie on the slope of a larger one beyond and is never interpolated.
struct Peak {
    bool inside = false;
    double place = 0.0, height = 0.0;
};
template <typename Value>
Peak FindPeak(int first, int last, int step, Value value) {
    int best = first;
    double height = value(first);
    const auto look = [&](int place) {
        if (const double there = value(place); there > height) {
            height = there;
            best = place;
        }
    };
    for (int place = first + step; place < last; place += step) look(place);
    look(last);
    const int near = best;
    for (int place = std::max(near - step + 1, first); place < std::min(near + step, last); ++place)
        if (place != near) look(place);
    if (best == first || best == last) return {};
    const ParabolaTop top(value(best - 1), height, value(best + 1));
    return {true, best + top.offset, top.height};
}

}  // namespace Corvo::DSP

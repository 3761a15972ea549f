#include "Spectrum/Fft/FftPlan.h"

#include <algorithm>
#include <cmath>
#include <new>
#include <numbers>

#include "Platform/Processor.h"

namespace Corvo::Fft {
namespace {

struct Root {
    double re, im;
};

// exp(-2 pi i k / n), n a power of two. The angle is brought below an eighth of a turn first, where it is
// small enough for the last bit to count.
Root UnitRoot(std::size_t k, std::size_t n) {
    k %= n;
    const std::size_t quarter = 4 * k / n;
    std::size_t rest = 4 * k - quarter * n;  // in quarters of a step
    const bool mirrored = 2 * rest > n;
    if (mirrored) rest = n - rest;
    const double angle = std::numbers::pi / 2.0 * static_cast<double>(rest) / static_cast<double>(n);
    double re = std::cos(angle), im = -std::sin(angle);
    if (mirrored) {
        const double swapped = -re;
        re = -im;
        im = swapped;
    }
    for (std::size_t turn = 0; turn < quarter; ++turn) {
        const double swapped = -re;
        re = im;
        im = swapped;
    }
    return {re, im};
}

struct Shape {
    std::size_t points, firstRadix, lastRadix;
    explicit Shape(std::size_t count)
        : points(std::max<std::size_t>(count, 1)), firstRadix(std::min<std::size_t>(points, 8)) {
        lastRadix = points / firstRadix;
        while (lastRadix > 8) lastRadix /= 4;
    }
    std::size_t FirstValues() const { return 2 * (firstRadix - 1) * (points / firstRadix); }
    // Each middle stage has 3/4 of its length in twiddle factors, and the next is a quarter as long.
    std::size_t MiddleValues() const {
        std::size_t values = 0;
        for (std::size_t n = points / firstRadix; n > lastRadix; n /= 4) values += 6 * (n / 4);
        return values;
    }
};

std::size_t Points(int order, Kind kind) {
    const std::size_t length = std::size_t{1} << order;
    return kind == Kind::Real ? length / 2 : length;
}

constexpr std::size_t kLine = 64;
constexpr std::size_t RoundToLine(std::size_t bytes) { return (bytes + kLine - 1) / kLine * kLine; }

}  // namespace

template <typename T>
std::size_t PlanBytes(int order, Kind kind) {
    const Shape shape(Points(order, kind));
    const std::size_t pack = kind == Kind::Real ? shape.points : 0;
    return RoundToLine(sizeof(Plan<T>)) + RoundToLine(shape.FirstValues() * sizeof(T)) +
           RoundToLine(shape.MiddleValues() * sizeof(T)) + RoundToLine(pack * sizeof(T));
}

template <typename T>
const Plan<T>* BuildPlan(void* memory, int order, Kind kind) {
    const Shape shape(Points(order, kind));
    auto* bytes = static_cast<unsigned char*>(memory);
    const auto take = [&bytes](std::size_t count) {
        auto* const taken = reinterpret_cast<T*>(bytes);
        bytes += RoundToLine(count * sizeof(T));
        return taken;
    };
    auto* const plan = new (bytes) Plan<T>{};
    bytes += RoundToLine(sizeof(Plan<T>));

    plan->points = Points(order, kind);
    plan->firstRadix = shape.firstRadix;
    plan->lastRadix = shape.lastRadix;
    plan->scale = static_cast<T>(1.0 / static_cast<double>(std::size_t{1} << order));
    plan->kernels = &BestKernels<T>();

    T* to = take(shape.FirstValues());
    plan->firstTwiddles = to;
    const std::size_t columns = shape.points / shape.firstRadix;
    const std::size_t group = std::min(columns, kFirstGroup);
    for (std::size_t first = 0; first < columns; first += group)
        for (std::size_t k = 1; k < shape.firstRadix; ++k, to += 2 * group)
            for (std::size_t i = 0; i < group; ++i) {
                const Root root = UnitRoot((first + i) * k, shape.points);
                to[i] = static_cast<T>(root.re);
                to[i + group] = static_cast<T>(root.im);
            }

    to = take(shape.MiddleValues());
    plan->middleTwiddles = to;
    for (std::size_t n = columns; n > shape.lastRadix; n /= 4)
        for (std::size_t p = 0; p < n / 4; ++p)
            for (std::size_t k = 1; k < 4; ++k) {
                const Root root = UnitRoot(p * k, n);
                *to++ = static_cast<T>(root.re);
                *to++ = static_cast<T>(root.im);
            }

    if (kind == Kind::Real) {
        to = take(shape.points);
        plan->packTwiddles = to;
        const std::size_t half = shape.points / 2;
        for (std::size_t k = 0; k < half; ++k) {
            const Root root = UnitRoot(k, 2 * shape.points);
            to[k] = static_cast<T>(root.re);
            to[k + half] = static_cast<T>(root.im);
        }
    }
    return plan;
}

template <typename T>
const Kernels<T>& BestKernels() {
    return HasAvx2() ? Avx2Kernels<T>() : BaselineKernels<T>();
}

template std::size_t PlanBytes<float>(int, Kind);
template std::size_t PlanBytes<double>(int, Kind);
template const Plan<float>* BuildPlan<float>(void*, int, Kind);
template const Plan<double>* BuildPlan<double>(void*, int, Kind);
template const Kernels<float>& BestKernels<float>();
template const Kernels<double>& BestKernels<double>();

}  // namespace Corvo::Fft

#pragma once

#include <cstddef>

namespace Corvo::Fft {

template <typename T>
struct Plan;

// One instruction set's transforms. `work` holds WorkValues(plan.points) values, aligned to 64 bytes; input
// and output may be the same array and need no alignment.
template <typename T>
struct Kernels {
    // Interleaved complex points, natural order; the inverse is scaled by plan.scale.
    void (*complexForward)(const Plan<T>& plan, const T* in, T* out, T* work);
    void (*complexInverse)(const Plan<T>& plan, const T* in, T* out, T* work);
    // 2 * plan.points real values and the packed spectrum: DC, Nyquist, then the bins as pairs.
    void (*realForward)(const Plan<T>& plan, const T* in, T* packed, T* work);
    void (*realInverse)(const Plan<T>& plan, const T* packed, T* out, T* work);
};

// A complex transform of a power of two of points as a sequence of stages: the first of radix 8, then some
// of radix 4, then a last one without twiddle factors that takes what is left. A real transform of twice as
// many values runs over the same stages, taking neighbours for real and imaginary parts.
template <typename T>
struct Plan {
    std::size_t points;       // 0 for a real transform of one value, which is its own spectrum
    std::size_t firstRadix;   // 1, 2, 4 or 8: below 8 only when that is all there is
    std::size_t lastRadix;    // 1, 2, 4 or 8
    const T* firstTwiddles;   // groups of up to 8 p: for k = 1..7, real parts of w^(pk), then imaginary
    const T* middleTwiddles;  // stage after stage: for each p, w^p, w^2p, w^3p as pairs
    const T* packTwiddles;    // real transforms: exp(-2 pi i k / 2 points), k < points / 2, real, then imag
    T scale;
    const Kernels<T>* kernels;
};

constexpr std::size_t kFirstGroup = 8;

// Two buffers of real and of imaginary parts. They are set off from each other, as a power of two apart they
// would meet in the same lines of the cache.
constexpr std::size_t kWorkGap = 32;
constexpr std::size_t WorkValues(std::size_t points) { return 4 * (points + kWorkGap); }

enum class Kind { Complex, Real };

// The memory that a plan for 2^order points (or real values) with its tables takes.
template <typename T>
std::size_t PlanBytes(int order, Kind kind);

// Builds the plan in `memory` (PlanBytes, aligned to 64) and returns it; it lives as long as the memory.
template <typename T>
const Plan<T>* BuildPlan(void* memory, int order, Kind kind);

// The transforms for the processor at hand, chosen once. All give the same bits.
template <typename T>
const Kernels<T>& BestKernels();
template <typename T>
const Kernels<T>& BaselineKernels();
template <typename T>
const Kernels<T>& Avx2Kernels();

}  // namespace Corvo::Fft

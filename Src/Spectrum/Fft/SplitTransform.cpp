#include "Spectrum/Fft/SplitTransform.h"

#include <bit>
#include <new>

#include "Spectrum/Fft/SplitSpectrum.h"

namespace Corvo::Fft {
namespace {

// The packed spectrum lies behind what the kernels work in.
float* PackedIn(float* work, std::size_t points) { return work + WorkValues(points); }

}  // namespace

void SplitTransform::Prepare(int length) {
    const auto order = static_cast<int>(std::bit_width(static_cast<unsigned>(length))) - 1;
    auto* const taken = TakePlan<float>(order, Kind::Real);
    if (!taken) throw std::bad_alloc();
    GiveBack(m_shared);
    m_shared = taken;
}

std::size_t SplitTransform::WorkFloats(int length) {
    const auto values = static_cast<std::size_t>(length);
    return WorkValues(values / 2) + values;
}

void SplitTransform::Forward(const float* in, float* re, float* im, float* work) const {
    const auto& plan = *m_shared->plan;
    float* const packed = PackedIn(work, plan.points);
    plan.kernels->realForward(plan, in, packed, work);
    SplitPairs(packed, re, im, plan.points);
}

void SplitTransform::Inverse(const float* re, const float* im, float* out, float* work) const {
    const auto& plan = *m_shared->plan;
    float* const packed = PackedIn(work, plan.points);
    JoinPairs(re, im, packed, plan.points);
    plan.kernels->realInverse(plan, packed, out, work);
}

}  // namespace Corvo::Fft

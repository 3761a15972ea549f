#pragma once

#include <cstddef>

#include "Spectrum/Fft/SharedPlan.h"

namespace Corvo::Fft {

// Real transforms of one length in single precision between samples and the split spectrum, with the bits of
// CorvoFFT. The memory that they work in is the caller's: transforms of many lengths can share it.
class SplitTransform {
public:
    SplitTransform() = default;
    ~SplitTransform() { GiveBack(m_shared); }
    SplitTransform(const SplitTransform&) = delete;
    SplitTransform& operator=(const SplitTransform&) = delete;

    // For `length` samples, a power of two from 2 to 524288. May wait, allocates; throws std::bad_alloc.
    void Prepare(int length);
    // Floats that a transform of `length` works in, from a cache line on.
    static std::size_t WorkFloats(int length);

    // Of the prepared length; neither allocates. Inputs stay as they are.
    void Forward(const float* in, float* re, float* im, float* work) const;
    void Inverse(const float* re, const float* im, float* out, float* work) const;

private:
    SharedPlan<float>* m_shared = nullptr;
};

}  // namespace Corvo::Fft

#include "Spectrum/Scales/DecibelKernel.h"

// Compiled for AVX2: nothing but the kernel belongs here.
namespace Corvo {

void PowerToDecibelsAvx2(const float* power, float* decibels, std::size_t count, float offset) {
    DecibelKernel<xsimd::avx2>::Run(power, decibels, count, offset);
}

}  // namespace Corvo

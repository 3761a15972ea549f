#include "DSP/Effects/Denoiser/SpectrumKernelsFor.h"

// Compiled for AVX2: nothing but the kernels belongs here.
namespace Corvo::DSP::Denoising {

const SpectrumKernels& Avx2SpectrumKernels() { return KernelsFor<xsimd::avx2>::kTable; }

}  // namespace Corvo::DSP::Denoising

#include "DSP/Effects/Gain/GainKernelFor.h"

// Compiled for AVX2: nothing but the kernels belongs here.
namespace Corvo::DSP::GainEfx {

template <typename Sample>
const Kernels<Sample>& Avx2Kernels() {
    return KernelsFor<Sample, xsimd::avx2>::kTable;
}

template const Kernels<float>& Avx2Kernels<float>();
template const Kernels<double>& Avx2Kernels<double>();

}  // namespace Corvo::DSP::GainEfx

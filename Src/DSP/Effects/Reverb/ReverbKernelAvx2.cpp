#include "DSP/Effects/Reverb/ReverbKernelFor.h"

// Compiled for AVX2: nothing but the kernels belongs here.
namespace Corvo::DSP {

template <typename T>
const ReverbKernels<T>& Avx2ReverbKernels() {
    return ReverbKernelsFor<T, xsimd::avx2>::kTable;
}

template const ReverbKernels<float>& Avx2ReverbKernels<float>();
template const ReverbKernels<double>& Avx2ReverbKernels<double>();

}  // namespace Corvo::DSP

#include "DSP/Equalizer/EqKernel.h"

// Compiled for AVX2: nothing but the kernels belongs here.
namespace Corvo::DSP {

template <typename Sample>
const EqKernels<Sample>& EqAvx2Kernels() {
    return EqKernelsFor<Sample, xsimd::avx2>::kTable;
}

template const EqKernels<float>& EqAvx2Kernels<float>();
template const EqKernels<double>& EqAvx2Kernels<double>();

}  // namespace Corvo::DSP

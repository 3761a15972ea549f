#include "Spectrum/Fft/FftKernels.h"

// Compiled for AVX2. Only kernels belong here: a function shared with the rest of the library could replace
// its copy there and fail on an older processor.
namespace Corvo::Fft {

template <typename T>
const Kernels<T>& Avx2Kernels() {
    return KernelsFor<T, xsimd::avx2>::kTable;
}

template const Kernels<float>& Avx2Kernels<float>();
template const Kernels<double>& Avx2Kernels<double>();

}  // namespace Corvo::Fft

#include "Spectrum/Fft/FftKernels.h"

namespace Corvo::Fft {

template <typename T>
const Kernels<T>& BaselineKernels() {
    return KernelsFor<T, xsimd::sse2>::kTable;
}

template const Kernels<float>& BaselineKernels<float>();
template const Kernels<double>& BaselineKernels<double>();

}  // namespace Corvo::Fft

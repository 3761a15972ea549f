#include "DSP/Effects/Gain/GainKernelFor.h"

namespace Corvo::DSP::GainEfx {

template <typename Sample>
const Kernels<Sample>& BaselineKernels() {
    return KernelsFor<Sample, xsimd::sse2>::kTable;
}

template const Kernels<float>& BaselineKernels<float>();
template const Kernels<double>& BaselineKernels<double>();

}  // namespace Corvo::DSP::GainEfx

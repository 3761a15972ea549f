#include "DSP/Equalizer/EqKernel.h"

namespace Corvo::DSP {

template <typename Sample>
const EqKernels<Sample>& EqBaselineKernels() {
    return EqKernelsFor<Sample, xsimd::sse2>::kTable;
}

template const EqKernels<float>& EqBaselineKernels<float>();
template const EqKernels<double>& EqBaselineKernels<double>();

}  // namespace Corvo::DSP

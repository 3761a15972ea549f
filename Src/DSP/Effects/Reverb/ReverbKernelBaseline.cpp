#include "DSP/Effects/Reverb/ReverbKernelFor.h"

namespace Corvo::DSP {

template <typename T>
const ReverbKernels<T>& BaselineReverbKernels() {
    return ReverbKernelsFor<T, xsimd::sse2>::kTable;
}

template const ReverbKernels<float>& BaselineReverbKernels<float>();
template const ReverbKernels<double>& BaselineReverbKernels<double>();

}  // namespace Corvo::DSP

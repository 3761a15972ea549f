#include "DSP/Effects/Tube/TubeShapers.h"

// Compiled for AVX2: nothing but the kernel belongs here.
namespace Corvo::DSP {

template <typename Sample>
TubeKernel<Sample> Avx2TubeKernel() {
    return TubeShapers::Shape<Sample, xsimd::avx2>;
}

template TubeKernel<float> Avx2TubeKernel<float>();
template TubeKernel<double> Avx2TubeKernel<double>();

}  // namespace Corvo::DSP

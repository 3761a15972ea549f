#include "DSP/Effects/Tube/TubeShapers.h"

namespace Corvo::DSP {

template <typename Sample>
TubeKernel<Sample> BaselineTubeKernel() {
    return TubeShapers::Shape<Sample, xsimd::sse2>;
}

template TubeKernel<float> BaselineTubeKernel<float>();
template TubeKernel<double> BaselineTubeKernel<double>();

}  // namespace Corvo::DSP

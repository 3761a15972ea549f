#include "DSP/Pitch/ClassicKernelFor.h"

namespace Corvo::DSP::ClassicPitch {

const Kernels& BaselineKernels() { return kKernels; }

}  // namespace Corvo::DSP::ClassicPitch

#include "DSP/Pitch/ClassicKernelFor.h"

// Compiled for AVX2: nothing but the kernels belongs here.
namespace Corvo::DSP::ClassicPitch {

const Kernels& Avx2Kernels() { return kKernels; }

}  // namespace Corvo::DSP::ClassicPitch

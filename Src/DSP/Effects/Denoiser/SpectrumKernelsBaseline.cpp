#include "DSP/Effects/Denoiser/SpectrumKernelsFor.h"
#include "Platform/Processor.h"

namespace Corvo::DSP::Denoising {

const SpectrumKernels& BaselineSpectrumKernels() { return KernelsFor<xsimd::sse2>::kTable; }

const SpectrumKernels& BestSpectrumKernels() {
    return HasAvx2() ? Avx2SpectrumKernels() : BaselineSpectrumKernels();
}

}  // namespace Corvo::DSP::Denoising

#include "DSP/Effects/Denoiser/SpectrumKernelsFor.h"

namespace Corvo::DSP::Denoising {

const SpectrumKernels& BaselineSpectrumKernels() { return KernelsFor<xsimd::sse2>::kTable; }

const SpectrumKernels& BestSpectrumKernels() {
    static const SpectrumKernels& best =
        xsimd::available_architectures().avx2 ? Avx2SpectrumKernels() : BaselineSpectrumKernels();
    return best;
}

}  // namespace Corvo::DSP::Denoising

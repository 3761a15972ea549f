#include "Spectrum/Scales/PowerToDecibels.h"

#include "Platform/Processor.h"
#include "Spectrum/Scales/DecibelKernel.h"

namespace Corvo {

void PowerToDecibelsBaseline(const float* power, float* decibels, std::size_t count, float offset) {
    DecibelKernel<xsimd::sse2>::Run(power, decibels, count, offset);
}

void PowerToDecibels(const float* power, float* decibels, std::size_t count, float offset) {
    const auto run = HasAvx2() ? PowerToDecibelsAvx2 : PowerToDecibelsBaseline;
    run(power, decibels, count, offset);
}

}  // namespace Corvo

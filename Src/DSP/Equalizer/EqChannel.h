#pragma once

#include "DSP/Equalizer/EqBand.h"
#include "Spectrum/kivspectrum.h"

namespace Corvo::DSP {

// What ParEQ keeps per channel.
struct EqChannel {
    explicit EqChannel(std::int32_t* counter) {
        for (auto& band : bands) band.ForEachCoefficient([counter](auto& c) { c.counter = counter; });
    }

    EqBands bands;
    kivspectrum analyser;
};

}  // namespace Corvo::DSP

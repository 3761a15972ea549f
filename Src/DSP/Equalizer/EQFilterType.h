#pragma once

#include <cstdint>

namespace Corvo::DSP {

// The types of an equaliser band. The values are part of saved settings; any other value is designed as a
// high-pass.
enum EQFilterType : std::int32_t {
    EQ_HIGHPASS = 0,
    EQ_HIGHSHELF_BUTTERWORTH = 1,
    EQ_PEAK = 2,
    EQ_LOWSHELF_BUTTERWORTH = 3,
    EQ_LOWPASS = 4,
    EQ_HIGHSHELF = 5,
    EQ_LOWSHELF = 6,
};

}  // namespace Corvo::DSP

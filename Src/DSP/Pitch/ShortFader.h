#pragma once

#include <cstdint>

namespace Corvo::DSP {

// The library-wide length that SetShortFaderNumSamples set; 0 until then.
std::int64_t ShortFaderNumSamples();

}  // namespace Corvo::DSP

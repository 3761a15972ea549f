#pragma once

#include <cstddef>

#include "Platform/Export.h"

namespace Corvo {

// decibels[k] = 10 log10(power[k]) + offset, within 0.0001 dB. Powers below 1e-30 and what is not a number
// count as 1e-30. The arrays may be the same. Any thread; one pass, no memory.
DSP_API void PowerToDecibels(const float* power, float* decibels, std::size_t count, float offset);

}  // namespace Corvo

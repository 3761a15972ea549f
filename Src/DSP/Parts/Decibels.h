#pragma once

#include <algorithm>
#include <cmath>
#include <cstdint>

namespace Corvo::DSP {

// Linear factor of a word in tenths of a decibel; silence at the floor and below it. Words of a chunk may be
// anything: above `loudest` they sound like it.
inline double GainFromTenthsOfDb(std::int32_t word, std::int32_t floor, std::int32_t loudest) {
    return word > floor ? std::pow(10.0, std::min(word, loudest) * 0.005) : 0.0;
}

}  // namespace Corvo::DSP

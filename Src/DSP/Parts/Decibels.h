#pragma once

#include <cmath>
#include <cstdint>

namespace Corvo::DSP {

// Linear factor of a word in tenths of a decibel; silence at the floor and below it.
inline double GainFromTenthsOfDb(std::int32_t word, std::int32_t floor) {
    return word > floor ? std::pow(10.0, word * 0.005) : 0.0;
}

}  // namespace Corvo::DSP

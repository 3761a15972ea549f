#pragma once

#include <cstddef>

namespace Corvo::Fft {

// Between a spectrum in pairs, as the kernels have it, and one of real and imaginary parts apart.

template <typename T>
void SplitPairs(const T* pairs, T* re, T* im, std::size_t count) {
    for (std::size_t k = 0; k < count; ++k) {
        re[k] = pairs[2 * k];
        im[k] = pairs[2 * k + 1];
    }
}

template <typename T>
void JoinPairs(const T* re, const T* im, T* pairs, std::size_t count) {
    for (std::size_t k = 0; k < count; ++k) {
        pairs[2 * k] = re[k];
        pairs[2 * k + 1] = im[k];
    }
}

}  // namespace Corvo::Fft
